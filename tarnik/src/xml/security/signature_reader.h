#ifndef TARNIK_XML_SECURITY_SIGNATURE_READER_H
#define TARNIK_XML_SECURITY_SIGNATURE_READER_H

#include <cstddef>
#include <string>
#include <vector>

#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>

namespace Tarnik::Xml::Security {

/// More references than this are a syntax error, which limits the work for one signature.
inline constexpr std::size_t kMaxReferences = 16;

/// The elements of the algorithms of a `Reference`, which may contain parameters.
struct ReferenceElements {
  const ElementNode* digestMethod = nullptr;
  std::vector<const ElementNode*> transforms;
};

/// The content of a ds:Signature element.
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

/// Reads a ds:Signature element, whose children must be in the order of the schema (XML
/// Signature 1.1, section 4). ds:Object is not allowed: signed content must be outside of the
/// signature. Throws `SignatureSyntaxException`.
SignatureContent ReadSignature(const ElementNode* element);

}  // namespace Tarnik::Xml::Security

#endif
