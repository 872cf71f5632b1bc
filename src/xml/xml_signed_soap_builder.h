#ifndef SSOCLIENT_XML_XML_SIGNED_SOAP_BUILDER_H
#define SSOCLIENT_XML_XML_SIGNED_SOAP_BUILDER_H

#include <memory>

#include <tarnik/core/ref.h>
#include <tarnik/crypto/private_key.h>

#include "xml/xml_base_builder.h"

namespace SsoClient {

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

}  // namespace SsoClient

#endif
