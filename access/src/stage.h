#ifndef SSOCLIENT_ACCESS_STAGE_H
#define SSOCLIENT_ACCESS_STAGE_H

#include <string>

#include <tarnik/http/bounded_user_agent.h>

namespace SsoClient::Access {

/// What a request waits for.
enum class Stage {
  kWorker,
  kTurnOfFunction,  ///< a place among the calls of the login's function
  kFunction,        ///< the login's function
  kGate,            ///< whether the login of another request is accepted
  kBase,            ///< the token of the other source
  kTurn,            ///< a place among the attempts
  kAttempt,
  kPause,  ///< the back-off before the next round
};

/// What follows "was waiting for" in messages. `url` and `exchange` are those of the attempt.
std::string Describe(Stage stage, const std::string& url, Tarnik::Http::ExchangeStage exchange);

/// False while the attempt is before the first byte of its request. It computes before and after
/// its exchange.
bool MayHaveSent(Tarnik::Http::ExchangeStage stage) noexcept;

}  // namespace SsoClient::Access

#endif
