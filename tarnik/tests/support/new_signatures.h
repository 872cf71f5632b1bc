#ifndef TARNIK_TESTS_SUPPORT_NEW_SIGNATURES_H
#define TARNIK_TESTS_SUPPORT_NEW_SIGNATURES_H

#include <tarnik/core/exception.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/xml/security/signature.h>
#include <tarnik/xml/xml_writer.h>

#include <string>

#include "support/signed_documents.h"

namespace Tarnik::Xml::Security::Testing {

inline constexpr const char* kEnveloped = "http://www.w3.org/2000/09/xmldsig#enveloped-signature";
inline constexpr const char* kExclusive = "http://www.w3.org/2001/10/xml-exc-c14n#";
inline constexpr const char* kExclusiveWithComments =
    "http://www.w3.org/2001/10/xml-exc-c14n#WithComments";
inline constexpr const char* kInclusive = "http://www.w3.org/TR/2001/REC-xml-c14n-20010315";
inline constexpr const char* kInclusiveWithComments =
    "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#WithComments";
inline constexpr const char* kRsaSha256 = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";
inline constexpr const char* kEcdsaSha256 = "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256";
inline constexpr const char* kSha256 = "http://www.w3.org/2001/04/xmlenc#sha256";

/// A request with what canonicalisation must get right: comments, namespaces of the elements
/// around, xml: attributes and characters to escape.
inline constexpr const char* kRequest =
    "<s:Envelope xmlns:s=\"urn:soap\" xmlns:unused=\"urn:unused\" xml:lang=\"en\">"
    "<s:Header><w:Security xmlns:w=\"urn:wsse\"><w:Timestamp Id=\"time\">now</w:Timestamp>"
    "</w:Security></s:Header>\n"
    "<s:Body xmlns=\"urn:plain\" Id=\"body\" b=\"2\" a=\"1&#10;\"><!-- a remark --><Ask>x &amp; "
    "y&#13;</Ask></s:Body></s:Envelope>";

inline const Ref<const Crypto::PrivateKey>& SignerKey() {
  static const auto key = Crypto::CreatePrivateKeyFromPem(Tests::Signer().privateKeyPem);
  return key;
}

inline std::string TextOf(const Node* node) {
  const Ref<StringWriter> writer = CreateStringWriter();
  WriteXml(node, writer.get());
  return writer->Text();
}

inline Ref<Signature> Blank(ElementNode* root, const char* c14n = kExclusive,
                            const char* method = kRsaSha256, const char* prefix = "ds") {
  Ref<Signature> signature;
  CreateBlankSignature(root, c14n, method, prefix, signature);
  return signature;
}

/// A request document and a blank signature for it.
struct Request {
  explicit Request(const char* c14n = kExclusive, const char* method = kRsaSha256,
                   const char* prefix = "ds", const char* text = kRequest)
      : document(Tests::ParseDocument(text)),
        signature(Blank(document->RootElement(), c14n, method, prefix)) {}

  void Reference(const char* uri, const char* digest = kSha256,
                 const char* transform = kExclusive) {
    signature->AddReference(uri, digest)->AddTransform(transform);
  }
  void Place() const {
    Tests::FindElement(document.get(), "Security")->AppendChild(signature->Element());
  }
  std::string Text() const { return TextOf(document.get()); }
  std::string SignedText() {
    Reference("#body");
    Reference("#time");
    signature->Sign(SignerKey().get());
    Place();
    return Text();
  }

  Ref<Document> document;
  Ref<Signature> signature;
};

/// The class and message of what `action` throws.
template <class Action>
std::string Refusal(Action action) {
  try {
    action();
  } catch (const SignatureSyntaxException& error) {
    return "syntax: " + error.Message();
  } catch (const XmlSecurityException& error) {
    return "security: " + error.Message();
  } catch (const InvalidStateException& error) {
    return "state: " + error.Message();
  } catch (const InvalidArgumentException& error) {
    return "argument: " + error.Message();
  }
  return "done";
}

}  // namespace Tarnik::Xml::Security::Testing

#endif
