#ifndef FUZZ_XML_MUTATOR_H
#define FUZZ_XML_MUTATOR_H

#include <cstddef>
#include <cstdint>

namespace Fuzz {

/// What `LLVMFuzzerCustomMutator` does for texts that are mostly XML: changes bytes like libFuzzer,
/// or elements and attributes, so that most results are well-formed. Unlike `EditXml` it makes
/// libFuzzer's next input itself, so the seed determines what changes, and the input is the text as
/// it is read.
std::size_t MutateXml(std::uint8_t* data, std::size_t size, std::size_t maxSize, unsigned seed);

}  // namespace Fuzz

#endif
