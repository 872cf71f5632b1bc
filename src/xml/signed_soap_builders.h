#ifndef SSOCLIENT_XML_SIGNED_SOAP_BUILDERS_H
#define SSOCLIENT_XML_SIGNED_SOAP_BUILDERS_H

#include <memory>
#include <string_view>

#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>

#include "xml/xml_signed_soap_builder.h"

namespace SsoClient {

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
