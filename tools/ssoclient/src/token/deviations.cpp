#include "token/deviations.h"

#include <algorithm>
#include <chrono>
#include <set>

#include "output/duration_text.h"
#include "token/confirmation_name.h"
#include "token/validity.h"

namespace SsoClient::Tool {
namespace {

using Tarnik::System::DateTime;

bool IsAbout(std::chrono::seconds lifetime, std::chrono::seconds asked) {
  return std::chrono::abs(lifetime - asked) <= asked / 100 + std::chrono::seconds(2);
}

const char* YesOrNo(bool value) {
  return value ? "yes" : "no";
}

std::string ListText(const std::set<std::string>& names) {
  std::string text;
  for (const std::string& each : names) {
    text += (text.empty() ? "" : ", ") + each;
  }
  return text.empty() ? "any" : text;
}

}  // namespace

std::vector<Deviation> FindDeviations(const SamlToken& token, const TokenSpec& spec, bool isBearer,
                                      const DateTime& now) {
  std::vector<Deviation> found;
  const auto compare = [&found](const char* field, bool isSame, const std::string& requested,
                                const std::string& issued) {
    if (!isSame) {
      found.push_back({field, requested, issued});
    }
  };
  const std::chrono::seconds asked(spec.tokenLifetimeSec);
  const auto period = SecondsBetween(token.StartTime(), token.ExpirationTime());
  const auto rest = SecondsBetween(now, token.ExpirationTime());
  compare("lifetime", IsAbout(period, asked) || IsAbout(rest, asked), DurationText(asked),
          DurationText(std::min(period, rest)));
  compare("renewable", token.IsRenewable() == spec.renewable, YesOrNo(spec.renewable),
          YesOrNo(token.IsRenewable()));
  compare("delegable", token.IsDelegable() == spec.delegable, YesOrNo(spec.delegable),
          YesOrNo(token.IsDelegable()));
  std::set<std::string> audiences;
  token.GetAudiences(audiences);
  compare("audiences", audiences == spec.audienceRestriction, ListText(spec.audienceRestriction),
          ListText(audiences));
  const TokenConfirmationType requested = isBearer ? BEARER : HOLDER_OF_KEY;
  compare("confirmation", token.ConfirmationType() == requested, ConfirmationName(requested),
          ConfirmationName(token.ConfirmationType()));
  return found;
}

}  // namespace SsoClient::Tool
