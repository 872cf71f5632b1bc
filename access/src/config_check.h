#ifndef SSOCLIENT_ACCESS_CONFIG_CHECK_H
#define SSOCLIENT_ACCESS_CONFIG_CHECK_H

#include <ssoclient/access/token_source.h>

namespace SsoClient::Access {

/// Throws `Tarnik::InvalidArgumentException` for what `CreateTokenSource` refuses, except what is
/// checked when the client of each endpoint is made.
void CheckConfig(const TokenSourceConfig& config);

/// Throws `Tarnik::InvalidArgumentException` for a spec that cannot be sent, as far as that can be
/// seen without making the request.
void CheckSpec(const TokenSpec& spec, const Login& login);

}  // namespace SsoClient::Access

#endif
