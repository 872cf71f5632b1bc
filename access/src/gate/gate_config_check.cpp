#include "gate/gate_config_check.h"

#include <algorithm>

#include <tarnik/core/exception.h>

#include "trust/trust_store_impl.h"

namespace SsoClient::Access {

namespace {

constexpr std::chrono::seconds kNoTime{0};
constexpr std::chrono::hours kThousandYears{24 * 365 * 1000};

void RequireOfGate(bool condition, const char* message) {
  if (!condition) {
    throw Tarnik::InvalidArgumentException(message);
  }
}

bool IsSaid(BearerTokens bearerTokens) noexcept {
  return bearerTokens == BearerTokens::kRefuse || bearerTokens == BearerTokens::kAccept;
}

}  // namespace

void CheckGateConfig(const GateConfig& config) {
  RequireOfGate(config.trust != nullptr, "The trust store of the gate (trust) is null.");
  RequireOfGate(dynamic_cast<const TrustStoreImpl*>(config.trust.get()) != nullptr,
                "The trust store of the gate (trust) was not created by CreateTrustStore.");
  RequireOfGate(!config.audiences.empty(), "The gate has no audience (audiences).");
  RequireOfGate(std::none_of(config.audiences.begin(), config.audiences.end(),
                             [](const std::string& audience) { return audience.empty(); }),
                "An audience of the gate (audiences) is empty.");
  RequireOfGate(IsSaid(config.bearerTokens),
                "It is not said whether the gate accepts bearer tokens (bearerTokens).");
  RequireOfGate(config.clockTolerance >= kNoTime,
                "The clock tolerance of the gate (clockTolerance) is negative.");
  RequireOfGate(config.longestLifetime > kNoTime,
                "The longest lifetime of the gate's tokens (longestLifetime) is not positive.");
  RequireOfGate(std::none_of(config.allowedGroups.begin(), config.allowedGroups.end(),
                             [](const PrincipalId& group) { return group.name.empty(); }),
                "The name of an allowed group of the gate (allowedGroups) is empty.");
  RequireOfGate(config.largestToken > 0,
                "The size of the gate's largest token (largestToken) is 0.");
}

void LimitGateDurations(GateConfig& config) noexcept {
  config.clockTolerance = std::min<std::chrono::seconds>(config.clockTolerance, kThousandYears);
  config.longestLifetime = std::min<std::chrono::seconds>(config.longestLifetime, kThousandYears);
}

}  // namespace SsoClient::Access
