#ifndef SSOCLIENT_ACCESS_TESTS_SUPPORT_SOURCE_FIXTURE_H
#define SSOCLIENT_ACCESS_TESTS_SUPPORT_SOURCE_FIXTURE_H

#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/recording_listener.h"
#include "support/scripted_endpoint.h"
#include "support/virtual_runtime.h"
#include "token_source_impl.h"

namespace SsoClient::Access::Testing {

using std::chrono::hours;
using std::chrono::milliseconds;
using std::chrono::minutes;
using std::chrono::seconds;

/// What a callback has received.
struct Reply {
  int calls = 0;
  std::shared_ptr<const SamlToken> token;
  std::shared_ptr<const Tarnik::Throwable> failure;

  bool Has() const { return calls == 1; }
  std::string Message() const { return failure == nullptr ? "" : failure->Message(); }
  template <class Exception>
  bool Is() const {
    return failure != nullptr && typeid(*failure) == typeid(Exception);
  }
};

/// A source over scripted endpoints, by default two that issue tokens of one hour, in virtual time.
/// The test sets `config` and the scripts, and then makes the source.
class SourceFixture : public ::testing::Test {
 protected:
  SourceFixture();
  /// Callbacks of calls that are still waiting run here.
  ~SourceFixture() override;

  /// Attempts of these logins are cancelled when all callers have left; see `AbandonedLoginTest`.
  void UseCertificate();
  /// Makes the source with as many endpoints as `config` has.
  void Make();
  /// A token from now on.
  std::shared_ptr<IssuedToken> NewToken(std::chrono::milliseconds lifetime);
  /// What an endpoint does that issues tokens of this lifetime.
  Script::Function Issues(std::chrono::milliseconds lifetime);
  /// What it does that fails always.
  static Script::Function Fails(AttemptOutcome outcome);
  void ForAll(const Script::Function& function);

  /// Calls without waiting. Nothing happens before `runtime->Settle`.
  std::shared_ptr<Reply> Ask(const TokenSpec& spec, const CallContext& context = {});
  /// The same, and lets what is due happen.
  Reply Get(const TokenSpec& spec, const CallContext& context = {});
  CallContext Within(std::chrono::milliseconds duration) const;
  static TokenSpec SpecFor(const std::string& audience);

  /// The attempts at all endpoints.
  std::size_t Attempts() const;

  std::shared_ptr<VirtualRuntime> runtime = std::make_shared<VirtualRuntime>();
  std::shared_ptr<RecordingListener> listener = std::make_shared<RecordingListener>();
  TokenSourceConfig config;
  std::string password = "secret";
  int passwordCalls = 0;
  std::vector<std::shared_ptr<Script>> scripts;
  std::shared_ptr<TokenSourceImpl> source;
  const TokenSpec spec = SpecFor("https://orders.example.com");

 private:
  int tokens_ = 0;
};

}  // namespace SsoClient::Access::Testing

#endif
