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

/// A SOAP 1.1 envelope (SOAP 1.1, section 4). An empty `header` leaves the Header element empty.
/// "wst" is declared on the Body, for bodies that do not declare it themselves.
std::shared_ptr<XMLCompositeBuilder> BuildEnvelope(const std::shared_ptr<XMLBaseBuilder>& header,
                                                   const std::shared_ptr<XMLBaseBuilder>& body);

/// Looks for the ids of a request's own certificate and signature inside of the tokens that it
/// carries: a service that found two elements of one id would refuse the request, or take the wrong
/// one. `envelope` has its certificate, if it is to have one, but not its signature. Throws
/// `Tarnik::InvalidArgumentException`.
void RequireOwnIds(const Tarnik::Xml::ElementNode& envelope);

/// An envelope whose Body and Timestamp are signed (Web Services Security: SOAP Message Security
/// 1.0, section 8) with RSA-SHA256 over exclusive canonical XML. Each build draws new ids.
class XMLSignedSoapBuilder final : public XMLBaseBuilder {
 public:
  /// `header` builds a wsse:Security element with a wsu:Timestamp. `keyInfo` builds the content of
  /// ds:KeyInfo and may be empty.
  XMLSignedSoapBuilder(std::shared_ptr<XMLBaseBuilder> header, std::shared_ptr<XMLBaseBuilder> body,
                       Tarnik::Ref<const Tarnik::Crypto::PrivateKey> privateKey,
                       std::shared_ptr<XMLBaseBuilder> keyInfo);

  /// Throws `Tarnik::Xml::Security::XmlSecurityException` when the key cannot sign, and
  /// `Tarnik::InvalidArgumentException` when a token carries an id of the request's own; `out` then
  /// holds an envelope without a signature.
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

}  // namespace SsoClient

#endif
