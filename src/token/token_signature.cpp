#include "token/token_signature.h"

#include <algorithm>

#include <ssoclient/exceptions.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "support/concat.h"
#include "support/namespaces.h"

namespace SsoClient {
namespace {

using Tarnik::Ref;
using Tarnik::Xml::ElementNode;
using Tarnik::Xml::Security::KeyInfoResolver;
using Tarnik::Xml::Security::Reference;
using Tarnik::Xml::Security::Signature;

Ref<Signature> ParseSignature(ElementNode* element) {
  try {
    return Tarnik::Xml::Security::CreateSignatureFromDom(element);
  } catch (const Tarnik::Xml::Security::SignatureSyntaxException& fault) {
    throw ParseException(Concat({"Signature syntax error: ", fault.Message()}));
  }
}

// XML Signature 1.1, section 4.4.3.3: an empty URI refers to the document that contains the
// signature, "#id" to the element with this id.
bool Covers(std::string_view uri, std::string_view assertionId) {
  return uri.empty() || (uri.front() == '#' && uri.substr(1) == assertionId);
}

// The content of KeyInfo is not signed, but it is part of the text that callers pass on. A reader
// that takes an assertion from anywhere in that text would find one there.
bool ContainsSamlElement(const ElementNode* keyInfo) {
  const ElementNode* element = keyInfo;
  while (element != nullptr && element->NamespaceUri() != kSamlNamespace) {
    element = element->NextElement(keyInfo);
  }
  return element != nullptr;
}

}  // namespace

Ref<Signature> ReadSignature(ChildCursor& cursor, std::string_view assertionId) {
  ElementNode* element = AsElement(cursor.Current());
  if (element == nullptr) {
    throw ParseException("Expected element ds:Signature not found");
  }
  Ref<Signature> signature = ParseSignature(element);
  const std::vector<Reference>& references = signature->References();
  const bool covered =
      std::any_of(references.begin(), references.end(),
                  [&](const Reference& reference) { return Covers(reference.uri, assertionId); });
  if (!covered) {
    throw ParseException("Token's signature must cover the entire token");
  }
  if (ContainsSamlElement(signature->KeyInfo().element.get())) {
    throw ParseException("Token's signature must not hold SAML elements");
  }
  cursor.Advance();
  return signature;
}

void VerifySignature(const Signature& signature, const KeyInfoResolver* resolver) {
  bool valid = false;
  try {
    valid = signature.Verify(resolver);
  } catch (const Tarnik::Xml::Security::XmlSecurityException& fault) {
    throw InvalidSignatureException(Concat({"Signature verification error. ", fault.Message()}));
  }
  if (!valid) {
    throw InvalidSignatureException(
        "Failed to verify signature: token might have been tampered with.");
  }
}

}  // namespace SsoClient
