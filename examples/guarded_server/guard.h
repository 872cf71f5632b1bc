#ifndef GUARDED_SERVER_GUARD_H
#define GUARDED_SERVER_GUARD_H

#include <memory>
#include <string>

#include <ssoclient/access/token_gate.h>

#include "token_in_request.h"

namespace GuardedServer {

/// Answers requests whose tokens a gate accepts. Thread-safe.
class Guard {
 public:
  explicit Guard(std::shared_ptr<const SsoClient::Access::TokenGate> gate)
      : gate_(std::move(gate)) {}

  /// `sender` names the peer in the log.
  Response Answer(const Request& request, const SsoClient::Access::Presenter& presenter,
                  const std::string& sender) const;

 private:
  std::shared_ptr<const SsoClient::Access::TokenGate> gate_;
};

}  // namespace GuardedServer

#endif
