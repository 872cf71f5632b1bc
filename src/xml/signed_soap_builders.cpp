#include "xml/signed_soap_builders.h"

#include <string>

#include "xml/binary_security_token.h"
#include "xml/builder_factories.h"
#include "xml/namespaces.h"
#include "xml/saml_token_reference.h"

namespace SsoClient {

namespace {

std::shared_ptr<XMLBaseBuilder> BuildCertificateReference() {
  auto reference =
      MakeCompositeBuilder("wsse", "SecurityTokenReference", {{"xmlns:wsse", kWsseNamespace}});
  reference->Add(MakeElementBuilder(
      "wsse", "Reference",
      {{"URI", std::string("#") + kCertificateId}, {"ValueType", kX509TokenType}}));
  return reference;
}

}  // namespace

std::shared_ptr<XMLSignedSoapBuilder> MakeSignedSoapBuilderForToken(
    const std::shared_ptr<XMLBaseBuilder>& header, const std::shared_ptr<XMLBaseBuilder>& body,
    const Tarnik::Ref<const Tarnik::Crypto::PrivateKey>& privateKey, std::string_view assertionId) {
  return std::make_shared<XMLSignedSoapBuilder>(header, body, privateKey,
                                                BuildSamlTokenReference(assertionId));
}

std::shared_ptr<XMLSignedSoapBuilder> MakeSignedSoapBuilderForCertificate(
    const std::shared_ptr<XMLBaseBuilder>& header, const std::shared_ptr<XMLBaseBuilder>& body,
    const Tarnik::Ref<const Tarnik::Crypto::PrivateKey>& privateKey,
    const Tarnik::Crypto::Certificate& certificate) {
  auto headerWithCertificate = std::make_shared<XMLCompositeBuilder>(header);
  headerWithCertificate->Add(BuildBinarySecurityToken(kCertificateId, certificate));
  return std::make_shared<XMLSignedSoapBuilder>(headerWithCertificate, body, privateKey,
                                                BuildCertificateReference());
}

}  // namespace SsoClient
