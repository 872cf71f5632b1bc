#ifndef TARNIK_XML_SECURITY_SIGNATURE_READER_H
#define TARNIK_XML_SECURITY_SIGNATURE_READER_H

#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>
#include <cstddef>
#include <string>
#include <vector>

namespace Tarnik::Xml::Security {

/// More references than this are a syntax error, so that the work on one signature is bounded.
inline constexpr std::size_t kMaxReferences = 16;

/// The elements that a `Reference` was read from: algorithms may have parameters inside.
struct ReferenceElements {
  const ElementNode* digestMethod = nullptr;
  std::vector<const ElementNode*> transforms;
};

/// What a ds:Signature element holds.
struct SignatureContent {
  const ElementNode* signedInfo = nullptr;
  const ElementNode* canonicalizationMethodElement = nullptr;
  const ElementNode* signatureMethodElement = nullptr;
  std::string canonicalizationMethod;
  std::string signatureMethod;
  std::vector<Reference> references;
  std::vector<ReferenceElements> referenceElements;  // one for each reference
  std::vector<unsigned char> signatureValue;
  KeyInfo keyInfo;
};

/// Reads a ds:Signature element in the order that the schema of XML-Signature, section 4 demands.
/// ds:Object is not allowed: what a signature covers stands outside of it. Throws
/// `SignatureSyntaxException`.
SignatureContent ReadSignature(const ElementNode* element);

}  // namespace Tarnik::Xml::Security

#endif
