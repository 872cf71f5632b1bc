#ifndef SSOCLIENT_TOOL_TOKEN_TOKEN_JSON_H
#define SSOCLIENT_TOOL_TOKEN_TOKEN_JSON_H

#include <nlohmann/json.hpp>

#include <ssoclient/saml_token.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>

namespace SsoClient::Tool {

/// What the token says, as members that docs/tool.md names: never its text, nor its signature.
/// Whether it is believed is for the caller to say.
nlohmann::json TokenJson(const SamlToken& token, const Tarnik::System::DateTime& now);

/// The members "subject", "issuer", "serialNumber", "sha256", "notBefore" and "notAfter".
nlohmann::json CertificateJson(const Tarnik::Crypto::Certificate& certificate);

}  // namespace SsoClient::Tool

#endif
