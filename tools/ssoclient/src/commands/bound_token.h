#ifndef SSOCLIENT_TOOL_COMMANDS_BOUND_TOKEN_H
#define SSOCLIENT_TOOL_COMMANDS_BOUND_TOKEN_H

#include <memory>
#include <string>

#include <ssoclient/holder_of_key_config.h>
#include <ssoclient/saml_token.h>
#include <tarnik/xml/security/key_info_resolver.h>

namespace SsoClient::Tool {

/// The remedy when a service refuses a request that a token makes, not a login.
inline constexpr char kRemedyOfRefusedToken[] =
    "log in again if the token has expired, was revoked, or is unknown to the service";

/// The token in the file, whose signature is verified, and which is bound to `key`. Whether it is
/// still valid is for the service to decide. Throws `ToolException`: with the status `kRefused` for
/// a token that is not verified, and of the kind "not-bound" for one without a key or with another.
std::shared_ptr<const SamlToken> ReadBoundToken(
    const std::string& path, bool mayBeOpen, const Tarnik::Xml::Security::KeyInfoResolver& signers,
    const HolderOfKeyConfig& key);

}  // namespace SsoClient::Tool

#endif
