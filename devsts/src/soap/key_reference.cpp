#include "soap/key_reference.h"

#include <stdexcept>

#include "signing/certificates.h"
#include "soap/element_reader.h"
#include "soap/fault.h"
#include "soap/presented_token.h"
#include "xml/document.h"
#include "xml/namespaces.h"
#include "xml/schema_values.h"

namespace DevSts {
namespace {

constexpr char kCertificateId[] = "holderOfKeyCertificate";
constexpr char kX509Token[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-x509-token-profile-1.0#X509v3";
constexpr char kSamlTokenType[] =
    "http://docs.oasis-open.org/wss/oasis-wss-saml-tokenprofile-1.1#SAMLV2.0";
constexpr char kSamlId[] = "http://docs.oasis-open.org/wss/oasis-wss-saml-token-profile-1.1#SAMLID";

void RequireValue(const xmlNode* element, const char* name, const std::string& expected,
                  const char* uri = nullptr) {
  const std::string value = AttributeOf(element, name, uri);
  if (value != expected) {
    ThrowInvalidSecurity(std::string(LocalName(element)) + "/@" + name + " is not " + expected +
                         " but " + value);
  }
}

std::string CertificateOfToken(const xmlNode* token) {
  RequireAttributes(token, {{"EncodingType"}, {"ValueType"}, {"Id", kWsuNamespace}});
  RequireValue(token, "EncodingType", kBase64Binary);
  RequireValue(token, "ValueType", kX509Token);
  RequireValue(token, "Id", kCertificateId, kWsuNamespace);
  try {
    return CertificateFromBase64(TextOf(token));
  } catch (const std::runtime_error& error) {
    ThrowInvalidSecurityToken(std::string("The BinarySecurityToken contains no certificate: ") +
                              error.what());
  }
}

std::string CertificateByReference(xmlNode* securityTokenReference, const SecurityHeader& header) {
  RequireAttributes(securityTokenReference, {});
  ElementReader reader(securityTokenReference);
  const xmlNode* reference = reader.Expect(kWsseNamespace, "Reference");
  reader.End();
  RequireAttributes(reference, {{"URI"}, {"ValueType"}});
  RequireValue(reference, "URI", std::string("#") + kCertificateId);
  RequireValue(reference, "ValueType", kX509Token);
  if (header.certificateToken == nullptr) {
    ThrowInvalidSecurity("The signature refers to a BinarySecurityToken that is missing");
  }
  if (header.assertion != nullptr) {
    ThrowInvalidSecurity("An assertion is not expected together with a BinarySecurityToken");
  }
  return CertificateOfToken(header.certificateToken);
}

std::string CertificateByKeyIdentifier(xmlNode* securityTokenReference,
                                       const SecurityHeader& header) {
  RequireAttributes(securityTokenReference, {{"TokenType", kWsse11Namespace}});
  RequireValue(securityTokenReference, "TokenType", kSamlTokenType, kWsse11Namespace);
  ElementReader reader(securityTokenReference);
  const xmlNode* identifier = reader.Expect(kWsseNamespace, "KeyIdentifier");
  reader.End();
  RequireAttributes(identifier, {{"ValueType"}});
  RequireValue(identifier, "ValueType", kSamlId);
  if (header.certificateToken != nullptr || header.userNameToken) {
    ThrowInvalidSecurity("An assertion that proves the key must be the only token");
  }
  const std::string id = TextOf(identifier);
  if (header.assertion == nullptr || AttributeOf(header.assertion, "ID") != id) {
    ThrowInvalidSecurity("The KeyIdentifier names no assertion of the header: " + id);
  }
  return HolderCertificateOf(header.assertion, "The presented token");
}

xmlNode* OnlyChild(const xmlNode* parent, const char* namespaceUri, const char* localName) {
  const std::vector<xmlNode*> children =
      parent != nullptr ? ChildElements(parent) : std::vector<xmlNode*>();
  const bool fits = children.size() == 1 && IsElement(children[0], namespaceUri, localName);
  return fits ? children[0] : nullptr;
}

xmlNode* KeyInfoOf(const xmlNode* signature) {
  return FirstChild(signature, kDsigNamespace, "KeyInfo");
}

}  // namespace

RequestSignature SignatureFormOf(const SecurityHeader& header) {
  if (header.signature == nullptr) {
    return RequestSignature::None;
  }
  const xmlNode* reference =
      OnlyChild(KeyInfoOf(header.signature), kWsseNamespace, "SecurityTokenReference");
  if (OnlyChild(reference, kWsseNamespace, "Reference") != nullptr) {
    return RequestSignature::ByCertificate;
  }
  if (OnlyChild(reference, kWsseNamespace, "KeyIdentifier") != nullptr) {
    return RequestSignature::ByToken;
  }
  return RequestSignature::Other;
}

std::string CertificateOfSignature(const SecurityHeader& header) {
  xmlNode* keyInfo = KeyInfoOf(header.signature);
  RequireAttributes(keyInfo, {});
  ElementReader reader(keyInfo);
  xmlNode* reference = reader.Expect(kWsseNamespace, "SecurityTokenReference");
  reader.End();
  switch (SignatureFormOf(header)) {
    case RequestSignature::ByCertificate:
      return CertificateByReference(reference, header);
    case RequestSignature::ByToken:
      return CertificateByKeyIdentifier(reference, header);
    default:
      ThrowInvalidSecurity("The SecurityTokenReference is neither a Reference nor a KeyIdentifier");
  }
}

}  // namespace DevSts
