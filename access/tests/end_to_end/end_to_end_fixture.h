#ifndef SSOCLIENT_ACCESS_TESTS_END_TO_END_END_TO_END_FIXTURE_H
#define SSOCLIENT_ACCESS_TESTS_END_TO_END_END_TO_END_FIXTURE_H

#include <initializer_list>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <devsts/server.h>
#include <ssoclient/access/token_source.h>
#include <ssoclient/ssoclient.h>

#include "end_to_end/awaiting_listener.h"
#include "end_to_end/gate.h"
#include "end_to_end/token_calls.h"

namespace SsoClient::Access::Testing {

inline constexpr char kUser[] = "alice@EXAMPLE.COM";
inline constexpr char kPassword[] = "secret";

/// How late a call may end after its deadline or its cancellation. A machine that is busy with
/// other work may be later, so tests take the best of several calls.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
inline constexpr std::chrono::milliseconds kPromptly{500};
#else
inline constexpr std::chrono::milliseconds kPromptly{50};
#endif

/// A password login of `kUser` that trusts the certificates and the signatures of `servers`, with
/// no endpoint.
TokenSourceConfig Trusting(std::initializer_list<const DevSts::Server*> servers);
/// The same with an https endpoint for each of `servers`.
TokenSourceConfig ConfigFor(std::initializer_list<const DevSts::Server*> servers);
/// The same with a key, to which tokens are bound.
TokenSourceConfig BoundConfigFor(std::initializer_list<const DevSts::Server*> servers);

/// A server that passes `gate` before it answers.
DevSts::ServerOptions Passing(Gate& gate);

DevSts::Misbehavior Stalling(DevSts::Stall stall);
DevSts::Misbehavior Answering(int status, const std::string& retryAfter = "");
/// Ends the connection instead of an answer.
DevSts::Misbehavior Resetting();
DevSts::Misbehavior Refusing(const std::string& faultCode);

/// The requests that all `servers` have received.
std::size_t RequestsOf(std::initializer_list<const DevSts::Server*> servers);

/// Waits until `count` callers of the source wait.
void AwaitCallers(const TokenSource& source, std::size_t count);

/// Real sources over dev STSs.
class EndToEndTest : public testing::Test {
 protected:
  /// Makes a source with the listener.
  std::shared_ptr<TokenSource> Make(TokenSourceConfig config) const {
    config.listener = listener_;
    return CreateTokenSource(std::move(config));
  }
  /// Waits for the ends of so many attempts, which are reported after the callers have their
  /// answer, and returns all in the order in which they began.
  std::vector<AttemptRecord> AwaitEnded(std::size_t count) const;
  /// Waits until the circuit of an endpoint is reported to be in this state.
  bool AwaitCircuit(const std::string& endpoint, CircuitState state) const;

  const std::shared_ptr<AwaitingListener> listener_ = std::make_shared<AwaitingListener>();
};

}  // namespace SsoClient::Access::Testing

#endif
