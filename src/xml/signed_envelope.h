#ifndef SSOCLIENT_XML_SIGNED_ENVELOPE_H
#define SSOCLIENT_XML_SIGNED_ENVELOPE_H

#include <memory>
#include <string_view>

#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/xml/element_node.h>

#include "xml/builders.h"

namespace SsoClient {

/// A SOAP 1.1 envelope without a signature (SOAP 1.1, section 4). With a null `header`, the Header
/// element is empty. The Body declares the prefix wst, for bodies that do not.
std::shared_ptr<XMLCompositeBuilder> BuildEnvelope(const std::shared_ptr<XMLBaseBuilder>& header,
                                                   const std::shared_ptr<XMLBaseBuilder>& body);

/// An envelope whose Body and Timestamp are signed (Web Services Security: SOAP Message Security
/// 1.0, section 8) with RSA-SHA256 over exclusive canonical XML. Each build generates new ids.
class XMLSignedSoapBuilder final : public XMLBaseBuilder {
 public:
  /// `header` builds a wsse:Security element with a wsu:Timestamp. `keyInfo` builds the content of
  /// ds:KeyInfo and may be null.
  XMLSignedSoapBuilder(std::shared_ptr<XMLBaseBuilder> header, std::shared_ptr<XMLBaseBuilder> body,
                       Tarnik::Ref<const Tarnik::Crypto::PrivateKey> privateKey,
                       std::shared_ptr<XMLBaseBuilder> keyInfo);

  /// Throws `Tarnik::Xml::Security::XmlSecurityException` when the key cannot sign, and
  /// `Tarnik::InvalidArgumentException` as `RejectReservedIds` does; `out` then holds an envelope
  /// without a signature.
  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  std::shared_ptr<XMLBaseBuilder> header_;
  std::shared_ptr<XMLBaseBuilder> body_;
  Tarnik::Ref<const Tarnik::Crypto::PrivateKey> privateKey_;
  std::shared_ptr<XMLBaseBuilder> keyInfo_;
};

/// An envelope that is signed with the key of the holder-of-key assertion `assertionId`, which must
/// be among the tokens of `header`.
std::shared_ptr<XMLSignedSoapBuilder> MakeSignedSoapBuilderForToken(
    const std::shared_ptr<XMLBaseBuilder>& header, const std::shared_ptr<XMLBaseBuilder>& body,
    const Tarnik::Ref<const Tarnik::Crypto::PrivateKey>& privateKey, std::string_view assertionId);

/// An envelope that is signed with the key of `certificate`, which is added to the header.
std::shared_ptr<XMLSignedSoapBuilder> MakeSignedSoapBuilderForCertificate(
    const std::shared_ptr<XMLBaseBuilder>& header, const std::shared_ptr<XMLBaseBuilder>& body,
    const Tarnik::Ref<const Tarnik::Crypto::PrivateKey>& privateKey,
    const Tarnik::Crypto::Certificate& certificate);

/// Throws `Tarnik::InvalidArgumentException` when a token in the request has the id of the
/// request's own certificate or signature, in any attribute that a service may take for an id: a
/// service that finds two elements with one id would reject the request, or use the wrong element.
/// `envelope` already contains its certificate, if there is one, but not its signature.
void RejectReservedIds(const Tarnik::Xml::ElementNode& envelope);

}  // namespace SsoClient

#endif
