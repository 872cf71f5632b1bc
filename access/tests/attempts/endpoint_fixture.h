#ifndef SSOCLIENT_ACCESS_TESTS_ATTEMPTS_ENDPOINT_FIXTURE_H
#define SSOCLIENT_ACCESS_TESTS_ATTEMPTS_ENDPOINT_FIXTURE_H

#include <chrono>
#include <exception>
#include <memory>
#include <string>

#include "attempt.h"
#include "integration/holder_of_key_fixture.h"

namespace SsoClient::Access {

using SsoClient::Testing::kPassword;
using SsoClient::Testing::kUser;

/// A configuration with a password login of `kUser` that trusts `server`.
TokenSourceConfig ConfigFor(const DevSts::Server& server);

/// A client with a copy of `config`.
inline std::unique_ptr<EndpointClient> CreateEndpointClient(const TokenSourceConfig& config,
                                                            const Endpoint& endpoint) {
  return CreateEndpointClient(std::make_shared<const TokenSourceConfig>(config), endpoint);
}

/// A limit that no test reaches.
Tarnik::Ref<Tarnik::Http::CallLimit> AMinute();

/// One attempt at `url` with a new client.
AttemptOutcome AttemptAt(const TokenSourceConfig& config, const std::string& url,
                         const TokenSpec& spec = SsoClient::Testing::TenMinutes(),
                         const std::string& secret = kPassword);

/// Checks the kind of a failure, the class of its exception, and that the record's message is that
/// of the exception, which is returned.
template <class Expected>
std::string ExpectFailure(const AttemptOutcome& outcome, FailureKind kind) {
  EXPECT_EQ(outcome.token, nullptr);
  EXPECT_STREQ(NameOf(outcome.kind), NameOf(kind)) << outcome.message;
  if (outcome.failure == nullptr) {
    ADD_FAILURE() << "there is no exception";
    return {};
  }
  try {
    std::rethrow_exception(outcome.failure);
  } catch (const Expected& failure) {
    EXPECT_EQ(typeid(failure), typeid(Expected));
    EXPECT_EQ(outcome.message, failure.what());
    return failure.what();
  } catch (const std::exception& failure) {
    ADD_FAILURE() << "another class: " << failure.what();
  }
  return {};
}

/// Attempts at one dev STS, which is well-behaved at the start of each test.
class EndpointTest : public SsoClient::Testing::HolderOfKeyTest {
 protected:
  static TokenSourceConfig Config() { return ConfigFor(Sts()); }
  /// The same with a key.
  static TokenSourceConfig BoundConfig();

  static AttemptOutcome AttemptHere(const TokenSpec& spec = SsoClient::Testing::TenMinutes(),
                                    const std::string& secret = kPassword) {
    return AttemptAt(Config(), Sts().HttpsUrl(), spec, secret);
  }
};

}  // namespace SsoClient::Access

#endif
