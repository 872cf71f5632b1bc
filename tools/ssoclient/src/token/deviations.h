#ifndef SSOCLIENT_TOOL_TOKEN_DEVIATIONS_H
#define SSOCLIENT_TOOL_TOKEN_DEVIATIONS_H

#include <string>
#include <vector>

#include <ssoclient/saml_token.h>
#include <ssoclient/token_spec.h>
#include <tarnik/system/date_time.h>

namespace SsoClient::Tool {

/// A field of an issued token that is not what was asked for.
struct Deviation {
  std::string field{};      ///< "lifetime", "renewable", "delegable", "audiences" or "confirmation"
  std::string requested{};  ///< for people
  std::string issued{};     ///< for people
};

/// Returns the fields of a token, issued at `now`, that differ from `spec`. The lifetime is
/// compared from the token's start and from `now`, with a tolerance of one percent plus two
/// seconds, and differs only if neither matches: a service may set the start back, and clocks may
/// differ.
std::vector<Deviation> FindDeviations(const SamlToken& token, const TokenSpec& spec, bool isBearer,
                                      const Tarnik::System::DateTime& now);

}  // namespace SsoClient::Tool

#endif
