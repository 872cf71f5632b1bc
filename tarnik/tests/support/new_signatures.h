#ifndef TARNIK_TESTS_SUPPORT_NEW_SIGNATURES_H
#define TARNIK_TESTS_SUPPORT_NEW_SIGNATURES_H

#include <string>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "support/algorithm_uris.h"
#include "support/signed_documents.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {

/// A request with everything that canonicalisation must handle: comments, inherited namespaces,
/// xml: attributes and characters to escape.
inline constexpr const char* kRequest =
    "<s:Envelope xmlns:s=\"urn:soap\" xmlns:unused=\"urn:unused\" xml:lang=\"en\">"
    "<s:Header><w:Security xmlns:w=\"urn:wsse\"><w:Timestamp Id=\"time\">now</w:Timestamp>"
    "</w:Security></s:Header>\n"
    "<s:Body xmlns=\"urn:plain\" Id=\"body\" b=\"2\" a=\"1&#10;\"><!-- a remark --><Ask>x &amp; "
    "y&#13;</Ask></s:Body></s:Envelope>";

inline const Ref<const Crypto::PrivateKey>& SignerKey() {
  static const auto key = Crypto::CreatePrivateKeyFromPem(Signer().privateKeyPem);
  return key;
}

inline Ref<Xml::Security::Signature> Blank(Xml::ElementNode* root, const char* c14n = kExclusive,
                                           const char* method = kRsaSha256,
                                           const char* prefix = "ds") {
  Ref<Xml::Security::Signature> signature;
  Xml::Security::CreateBlankSignature(root, c14n, method, prefix, signature);
  return signature;
}

/// A request document and a blank signature for it.
struct Request {
  explicit Request(const char* c14n = kExclusive, const char* method = kRsaSha256,
                   const char* prefix = "ds", const char* text = kRequest)
      : document(ParseXml(text)), signature(Blank(document->RootElement(), c14n, method, prefix)) {}

  void Reference(const char* uri, const char* digest = kSha256,
                 const char* transform = kExclusive) {
    signature->AddReference(uri, digest)->AddTransform(transform);
  }
  void Place() const { FindElement(document.get(), "Security")->AppendChild(signature->Element()); }
  std::string Text() const { return XmlText(document.get()); }
  std::string SignedText() {
    Reference("#body");
    Reference("#time");
    signature->Sign(SignerKey().get());
    Place();
    return Text();
  }

  Ref<Xml::Document> document;
  Ref<Xml::Security::Signature> signature;
};

/// The class and message of what `action` throws.
template <class Action>
std::string Refusal(Action action) {
  try {
    action();
  } catch (const Xml::Security::SignatureSyntaxException& error) {
    return "syntax: " + error.Message();
  } catch (const Xml::Security::XmlSecurityException& error) {
    return "security: " + error.Message();
  } catch (const InvalidStateException& error) {
    return "state: " + error.Message();
  } catch (const InvalidArgumentException& error) {
    return "argument: " + error.Message();
  }
  return "done";
}

}  // namespace Tarnik::Testing

#endif
