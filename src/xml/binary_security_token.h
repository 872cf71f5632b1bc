#ifndef SSOCLIENT_XML_BINARY_SECURITY_TOKEN_H
#define SSOCLIENT_XML_BINARY_SECURITY_TOKEN_H

#include <memory>
#include <string>

#include <tarnik/crypto/certificate.h>

#include "xml/xml_base_builder.h"

namespace SsoClient {

/// The value type of a certificate (Web Services Security: X.509 Token Profile 1.0, section 3.1).
inline constexpr char kX509TokenType[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-x509-token-profile-1.0#X509v3";

/// wsse:BinarySecurityToken that carries `certificate` under the wsu:Id `id` (Web Services
/// Security: SOAP Message Security 1.0, section 6.3).
std::shared_ptr<XMLBaseBuilder> BuildBinarySecurityToken(
    const std::string& id, const Tarnik::Crypto::Certificate& certificate);

}  // namespace SsoClient

#endif
