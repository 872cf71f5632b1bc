#include "gate/gate_config_check.h"

#include <algorithm>

#include "require.h"
#include "trust/trust_store_impl.h"

namespace SsoClient::Access {

namespace {

constexpr std::chrono::seconds kNoTime{0};
constexpr std::chrono::hours kThousandYears{24 * 365 * 1000};

bool IsSaid(BearerTokens bearerTokens) noexcept {
  return bearerTokens == BearerTokens::kRefuse || bearerTokens == BearerTokens::kAccept;
}

}  // namespace

void CheckGateConfig(const GateConfig& config) {
  Require(config.trust != nullptr, "The trust store of the gate (trust) is null.");
  Require(dynamic_cast<const TrustStoreImpl*>(config.trust.get()) != nullptr,
          "The trust store of the gate (trust) was not created by CreateTrustStore.");
  Require(!config.audiences.empty(), "The gate has no audience (audiences).");
  Require(std::none_of(config.audiences.begin(), config.audiences.end(),
                       [](const std::string& audience) { return audience.empty(); }),
          "An audience of the gate (audiences) is empty.");
  Require(IsSaid(config.bearerTokens),
          "It is not said whether the gate accepts bearer tokens (bearerTokens).");
  Require(config.clockTolerance >= kNoTime,
          "The clock tolerance of the gate (clockTolerance) is negative.");
  Require(config.longestLifetime > kNoTime,
          "The longest lifetime of the gate's tokens (longestLifetime) is not positive.");
  Require(std::none_of(config.allowedGroups.begin(), config.allowedGroups.end(),
                       [](const PrincipalId& group) { return group.name.empty(); }),
          "The name of an allowed group of the gate (allowedGroups) is empty.");
  Require(config.largestToken > 0, "The size of the gate's largest token (largestToken) is 0.");
}

void LimitGateDurations(GateConfig& config) noexcept {
  config.clockTolerance = std::min<std::chrono::seconds>(config.clockTolerance, kThousandYears);
  config.longestLifetime = std::min<std::chrono::seconds>(config.longestLifetime, kThousandYears);
}

}  // namespace SsoClient::Access
