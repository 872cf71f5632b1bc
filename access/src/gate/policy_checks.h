#ifndef SSOCLIENT_ACCESS_GATE_POLICY_CHECKS_H
#define SSOCLIENT_ACCESS_GATE_POLICY_CHECKS_H

#include <string>

#include "gate/trust_checks.h"
#include "gate/verdict_facts.h"

namespace SsoClient::Access {

/// The checks of a token whose signature is verified, from its audiences on. May set `detail`.
CheckResult CheckPolicy(const CheckedToken& checked, const Presenter& presenter,
                        std::string& detail);

}  // namespace SsoClient::Access

#endif
