#ifndef SSOCLIENT_ACCESS_CONFIG_CHECK_H
#define SSOCLIENT_ACCESS_CONFIG_CHECK_H

#include <ssoclient/access/token_source.h>

namespace SsoClient::Access {

/// Throws `Tarnik::InvalidArgumentException` for what `CreateTokenSource` refuses, except what is
/// checked when the client of each endpoint is made.
void CheckConfig(const TokenSourceConfig& config);

/// Limits the durations of a configuration that has been checked to `kLongestDuration`, so that the
/// clocks can represent what is computed from them.
void LimitDurations(TokenSourceConfig& config) noexcept;

/// Throws `Tarnik::InvalidArgumentException` for a spec that cannot be sent, as far as that can be
/// seen without making the request and without looking at its texts.
void CheckSpec(const TokenSpec& spec, const Login& login);

/// The same for a spec with a text that XML does not allow (XML 1.0, section 2.2). Reads all texts
/// but that of the act-as token.
void CheckTexts(const TokenSpec& spec);

}  // namespace SsoClient::Access

#endif
