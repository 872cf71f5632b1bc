#ifndef SSOCLIENT_XML_SECURITY_HEADER_H
#define SSOCLIENT_XML_SECURITY_HEADER_H

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include <tarnik/crypto/certificate.h>

#include "xml/builders.h"

namespace SsoClient {

/// wsse:Security (Web Services Security: SOAP Message Security 1.0, section 5) with a timestamp
/// (section 10) that is valid from now on for `minutes`, at most 35. The caller adds tokens behind
/// it.
std::shared_ptr<XMLCompositeBuilder> BuildSecurityHeader(std::uint32_t minutes);

/// wsse:UsernameToken with the name alone (Web Services Security UsernameToken Profile 1.0,
/// section 3).
std::shared_ptr<XMLCompositeBuilder> BuildUsernameToken(std::string_view user);

/// The same with the password in clear text, without nonce or creation time.
std::shared_ptr<XMLCompositeBuilder> BuildUsernamePasswordToken(std::string_view user,
                                                                std::string_view password);

/// The value type of a certificate (Web Services Security: X.509 Token Profile 1.0, section 3.1).
inline constexpr char kX509TokenType[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-x509-token-profile-1.0#X509v3";

/// wsse:BinarySecurityToken that carries `certificate` under the wsu:Id `id` (Web Services
/// Security: SOAP Message Security 1.0, section 6.3).
std::shared_ptr<XMLBaseBuilder> BuildBinarySecurityToken(
    const std::string& id, const Tarnik::Crypto::Certificate& certificate);

/// wsse:SecurityTokenReference to the assertion with the ID `assertionId` (Web Services Security:
/// SAML Token Profile 1.1, section 3.4).
std::shared_ptr<XMLCompositeBuilder> BuildSamlTokenReference(std::string_view assertionId);

}  // namespace SsoClient

#endif
