#ifndef FUZZ_XML_EDITS_H
#define FUZZ_XML_EDITS_H

#include <string>

#include <fuzzer/FuzzedDataProvider.h>

namespace Fuzz {

/// Changes a text as `input` says: an octet, a piece, an element that is moved or copied, an
/// attribute that is added, or markup that may change the canonical form. Unlike `MutateXml` it
/// edits a text that the fuzzer has made from the same input, such as one that it has signed
/// before, so what to edit comes from the input too.
void EditXml(std::string& xml, FuzzedDataProvider& input);

}  // namespace Fuzz

#endif
