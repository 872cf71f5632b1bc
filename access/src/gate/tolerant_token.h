#ifndef SSOCLIENT_ACCESS_GATE_TOLERANT_TOKEN_H
#define SSOCLIENT_ACCESS_GATE_TOLERANT_TOKEN_H

#include <chrono>
#include <memory>

#include <ssoclient/saml_token.h>

namespace SsoClient::Access {

/// `token` with a clock tolerance of `tolerance` instead of the one that it was created with.
/// Everything else is its own.
std::shared_ptr<const SamlToken> WithTolerance(std::shared_ptr<const SamlToken> token,
                                               std::chrono::seconds tolerance);

}  // namespace SsoClient::Access

#endif
