#ifndef FUZZ_SIGNATURE_MODEL_H
#define FUZZ_SIGNATURE_MODEL_H

#include <libxml/tree.h>

namespace Fuzz {

/// True if an element has the structure of ds:Signature (XML Signature 1.1, section 4) with at most
/// 16 references, each with a URI, and without ds:Object. What ds:KeyInfo contains is not read.
bool IsSignatureShaped(const xmlNode* element);

}  // namespace Fuzz

#endif
