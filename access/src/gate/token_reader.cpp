#include "gate/token_reader.h"

#include <algorithm>
#include <cstddef>
#include <limits>
#include <set>
#include <utility>
#include <vector>

#include <tarnik/core/exception.h>
#include <tarnik/text/display_text.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "gate/confirmation_end.h"
#include "gate/tolerant_token.h"

namespace SsoClient::Access {

namespace {

// Some messages quote what they found in the token in place of a name.
constexpr std::size_t kMaxDetail = 300;

std::shared_ptr<const SamlToken> CreateToken(const std::string& text, ReadFailure& failure) {
  try {
    return CreateSamlToken(text, std::numeric_limits<long>::max());
  } catch (const Tarnik::Xml::XMLParseException& e) {
    failure = {Reason::kNotWellFormed, Tarnik::ToDisplayText(e.Message(), kMaxDetail)};
  } catch (const Tarnik::Exception& e) {
    failure = {Reason::kBadLayout, Tarnik::ToDisplayText(e.Message(), kMaxDetail)};
  }
  return nullptr;
}

bool IsIn(const PrincipalId& group, const std::vector<PrincipalId>& groups) {
  return std::find(groups.begin(), groups.end(), group) != groups.end();
}

const PrincipalId* FindGroup(const SamlToken& token, const std::vector<PrincipalId>& allowed) {
  if (allowed.empty()) {
    return nullptr;
  }
  std::vector<PrincipalId> groups;
  token.GetGroups(groups);
  const auto found =
      std::find_if(allowed.begin(), allowed.end(),
                   [&groups](const PrincipalId& group) { return IsIn(group, groups); });
  return found == allowed.end() ? nullptr : &*found;
}

const std::string* FindAudience(const std::set<std::string>& audiences,
                                const std::vector<std::string>& own) {
  const auto found = std::find_if(own.begin(), own.end(), [&](const std::string& audience) {
    return audiences.find(audience) != audiences.end();
  });
  return found == own.end() ? nullptr : &*found;
}

TokenTraits TraitsOf(const SamlToken& token, const GateConfig& config) {
  std::set<std::string> audiences;
  token.GetAudiences(audiences);
  std::vector<Delegate> chain;
  token.GetDelegationChain(chain);
  TokenTraits traits;
  traits.confirmationEnd = ConfirmationEndOf(token);
  traits.audience = FindAudience(audiences, config.audiences);
  traits.group = FindGroup(token, config.allowedGroups);
  traits.delegates = chain.size();
  traits.isRestricted = !audiences.empty();
  return traits;
}

}  // namespace

std::shared_ptr<CheckedToken> ReadToken(const std::string& text,
                                        const std::shared_ptr<const GateConfig>& config,
                                        const Tarnik::System::DateTime& now, ReadFailure& failure) {
  std::shared_ptr<const SamlToken> token = CreateToken(text, failure);
  if (token == nullptr) {
    return nullptr;
  }
  auto checked = std::make_shared<CheckedToken>();
  checked->traits = TraitsOf(*token, *config);
  checked->token = WithTolerance(std::move(token), config->clockTolerance);
  checked->config = config;
  checked->readAt = now;
  return checked;
}

}  // namespace SsoClient::Access
