#ifndef SSOCLIENT_ACCESS_GATE_TOKEN_READER_H
#define SSOCLIENT_ACCESS_GATE_TOKEN_READER_H

#include <memory>
#include <string>

#include <ssoclient/access/token_gate.h>

#include "gate/verdict_facts.h"

namespace SsoClient::Access {

/// Why a token could not be read.
struct ReadFailure {
  Reason reason = Reason::kNone;  ///< `kNotWellFormed` or `kBadLayout`
  std::string detail;             ///< a text for records
};

/// Reads the token without looking at its period of validity and its signature. Returns null and
/// sets `failure` if that is not possible. Throws `std::bad_alloc`.
std::shared_ptr<CheckedToken> ReadToken(const std::string& text,
                                        const std::shared_ptr<const GateConfig>& config,
                                        const Tarnik::System::DateTime& now, ReadFailure& failure);

}  // namespace SsoClient::Access

#endif
