#ifndef SSOCLIENT_XML_SECURITY_HEADER_H
#define SSOCLIENT_XML_SECURITY_HEADER_H

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include <tarnik/crypto/certificate.h>

#include "xml/builders.h"

namespace SsoClient {

/// The encoding type of binary tokens: Base64 (Web Services Security: SOAP Message Security 1.0,
/// section 6.3).
inline constexpr char kBase64BinaryEncoding[] =
    "http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-soap-message-security-1.0#Base64Binary";

/// The value type of a certificate (Web Services Security: X.509 Token Profile 1.0, section 3.1).
inline constexpr char kX509TokenType[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-x509-token-profile-1.0#X509v3";

/// The Id of a request's signature, by which wst:UseKey refers to it.
inline constexpr char kProofSignatureId[] = "holderOfKeyProofSignature";

/// The wsu:Id of the certificate in a request's header, by which the signature refers to it.
inline constexpr char kCertificateId[] = "holderOfKeyCertificate";

/// wsse:Security (Web Services Security: SOAP Message Security 1.0, section 5) with a timestamp
/// (section 10) that is valid from now for `minutes`, at most 35. The caller adds tokens after it.
std::shared_ptr<XMLCompositeBuilder> BuildSecurityHeader(std::uint32_t minutes);

/// wsse:UsernameToken with only the name (Web Services Security: UsernameToken Profile 1.0,
/// section 3).
std::shared_ptr<XMLCompositeBuilder> BuildUsernameToken(std::string_view user);

/// The same with the password in clear text, without nonce or creation time.
std::shared_ptr<XMLCompositeBuilder> BuildUsernamePasswordToken(std::string_view user,
                                                                std::string_view password);

/// wsse:BinarySecurityToken that contains `certificate` and has the wsu:Id `id` (Web Services
/// Security: SOAP Message Security 1.0, section 6.3).
std::shared_ptr<XMLBaseBuilder> BuildBinarySecurityToken(
    const std::string& id, const Tarnik::Crypto::Certificate& certificate);

/// wsse:SecurityTokenReference to the assertion with the ID `assertionId` (Web Services Security:
/// SAML Token Profile 1.1, section 3.4).
std::shared_ptr<XMLCompositeBuilder> BuildSamlTokenReference(std::string_view assertionId);

/// wsse:SecurityTokenReference to the certificate with the wsu:Id `kCertificateId` (Web Services
/// Security: X.509 Token Profile 1.0, section 3.2).
std::shared_ptr<XMLCompositeBuilder> BuildCertificateReference();

}  // namespace SsoClient

#endif
