#ifndef SSOCLIENT_TOOL_TOKEN_UNVERIFIED_TOKEN_H
#define SSOCLIENT_TOOL_TOKEN_UNVERIFIED_TOKEN_H

#include <memory>
#include <string>

#include <ssoclient/saml_token.h>
#include <tarnik/crypto/certificate.h>

namespace SsoClient::Tool {

/// Reads a token whenever it is or was valid, without verifying its signature: anyone can have
/// written it. Throws `ToolException` of the kind "not-a-token" when the text is not an assertion
/// of the accepted structure.
std::shared_ptr<const SamlToken> ReadUnverifiedToken(const std::string& text);

/// The certificate in the token that is said to be its signer's; null if it contains none, or one
/// that cannot be decoded.
Tarnik::Ref<const Tarnik::Crypto::Certificate> ClaimedSigner(const SamlToken& token);

/// The signature algorithm in words, such as "RSA PKCS#1 with SHA-256"; the URI itself if it is
/// none that the library verifies.
std::string SignatureAlgorithmText(const std::string& uri);

}  // namespace SsoClient::Tool

#endif
