#ifndef SSOCLIENT_ACCESS_GATE_GATE_CONFIG_CHECK_H
#define SSOCLIENT_ACCESS_GATE_GATE_CONFIG_CHECK_H

#include <ssoclient/access/token_gate.h>

namespace SsoClient::Access {

/// Throws `Tarnik::InvalidArgumentException` for what `CreateTokenGate` refuses.
void CheckGateConfig(const GateConfig& config);

/// Limits the durations of a configuration that has been checked to a thousand years, so that
/// microseconds can represent what is computed from them.
void LimitGateDurations(GateConfig& config) noexcept;

}  // namespace SsoClient::Access

#endif
