#ifndef DEVSTS_SIGNATURE_SHAPE_H
#define DEVSTS_SIGNATURE_SHAPE_H

#include <libxml/tree.h>

#include <string>

namespace DevSts {

// The Id that a request's signature bears and that wst:UseKey names.
inline constexpr char kProofSignatureId[] = "holderOfKeyProofSignature";

// Requires that the signature is laid out as a request's must be: RSA-SHA256 over exclusive
// canonical form, with one reference to each of these ids, in this order, each by SHA-256 over
// exclusive canonical form alone. Nothing is verified. Throws Fault.
void RequireSignatureShape(xmlNode* signature, const std::string& bodyId,
                           const std::string& timestampId);

}  // namespace DevSts

#endif
