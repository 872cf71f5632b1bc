#include "xml/security/signature_reader.h"

#include <tarnik/xml/security/xml_security_exception.h>

#include "support/quote.h"
#include "xml/security/content_reader.h"
#include "xml/security/key_info_reader.h"

namespace Tarnik::Xml::Security {
namespace {

void ReadTransforms(const ElementNode* element, Reference& reference, ReferenceElements& elements) {
  ExpectAttributes(element, {});
  ContentReader content(element);
  do {
    const ElementNode* transform = content.Take("Transform");
    reference.transforms.push_back(AlgorithmOf(transform));
    elements.transforms.push_back(transform);
  } while (content.Peek() != nullptr);
}

// Without a URI the application must know the target (XML Signature 1.1, section 4.4.3.1). This is
// not supported.
std::string UriOf(const ElementNode* element) {
  ExpectAttributes(element, {"Id", "URI", "Type"});
  const auto uri = element->FindAttribute("URI");
  if (!uri) {
    throw SignatureSyntaxException("Element " + Quote(element->QualifiedNameText()) +
                                   " lacks the attribute 'URI'.");
  }
  return std::string(*uri);
}

void ReadReference(const ElementNode* element, SignatureContent& signature) {
  if (signature.references.size() == kMaxReferences) {
    throw SignatureSyntaxException("A signature may have no more than " +
                                   std::to_string(kMaxReferences) + " references.");
  }
  Reference& reference = signature.references.emplace_back();
  ReferenceElements& elements = signature.referenceElements.emplace_back();
  reference.uri = UriOf(element);
  ContentReader content(element);
  if (const ElementNode* transforms = content.TakeIf("Transforms")) {
    ReadTransforms(transforms, reference, elements);
  }
  elements.digestMethod = content.Take("DigestMethod");
  reference.digestMethod = AlgorithmOf(elements.digestMethod);
  const ElementNode* value = content.Take("DigestValue");
  ExpectAttributes(value, {});
  reference.digestValue = BytesOf(value);
  content.ExpectEnd();
}

void ReadSignedInfo(const ElementNode* element, SignatureContent& signature) {
  ExpectAttributes(element, {"Id"});
  signature.signedInfo = element;
  ContentReader content(element);
  signature.canonicalizationMethodElement = content.Take("CanonicalizationMethod");
  signature.canonicalizationMethod = AlgorithmOf(signature.canonicalizationMethodElement);
  signature.signatureMethodElement = content.Take("SignatureMethod");
  signature.signatureMethod = AlgorithmOf(signature.signatureMethodElement);
  do {
    ReadReference(content.Take("Reference"), signature);
  } while (content.Peek() != nullptr);
}

void ExpectSignature(const ElementNode* element) {
  if (element->LocalName() != "Signature" || element->NamespaceUri() != kDsNamespace) {
    throw SignatureSyntaxException("Element " + Quote(element->QualifiedNameText()) +
                                   " is not the Signature of XML-Signature.");
  }
  ExpectAttributes(element, {"Id"});
}

}  // namespace

SignatureContent ReadSignature(const ElementNode* element) {
  ExpectSignature(element);
  SignatureContent signature;
  ContentReader content(element);
  ReadSignedInfo(content.Take("SignedInfo"), signature);
  const ElementNode* value = content.Take("SignatureValue");
  ExpectAttributes(value, {"Id"});
  signature.signatureValue = BytesOf(value);
  if (const ElementNode* keyInfo = content.TakeIf("KeyInfo")) {
    signature.keyInfo = ReadKeyInfo(keyInfo);
  }
  content.ExpectEnd();
  return signature;
}

}  // namespace Tarnik::Xml::Security
