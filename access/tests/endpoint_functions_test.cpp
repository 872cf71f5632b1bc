#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "attempt.h"

namespace SsoClient::Access {

namespace {

/// A function with a state of its own, which copies do not share.
struct CountingFunction {
  std::shared_ptr<std::vector<int>> seen;
  int calls = 0;

  std::shared_ptr<NegotiationHandler> operator()(const Endpoint&) {
    seen->push_back(++calls);
    return nullptr;
  }
};

TEST(EndpointFunctionsTest, AllEndpointsUseTheSameFunction) {
  const auto seen = std::make_shared<std::vector<int>>();
  auto config = std::make_shared<TokenSourceConfig>();
  config->endpoints = {{"http://a.example.com", ""}, {"http://b.example.com", ""}};
  config->tokenFactory = CreateSamlTokenFactory(nullptr);
  config->login = NegotiatedLogin{CountingFunction{seen}};
  const TokenSpec spec{};
  const std::string none;
  const auto limit = Tarnik::Http::CreateCallLimit(std::chrono::steady_clock::time_point::max());
  for (const Endpoint& endpoint : config->endpoints) {
    const auto client = CreateEndpointClient(config, endpoint);
    const AttemptOutcome outcome =
        client->Attempt({AttemptOperation::kLogin, spec, nullptr, none}, *limit);
    EXPECT_EQ(outcome.kind, FailureKind::kSecretFailed) << outcome.message;
  }
  EXPECT_EQ(*seen, (std::vector<int>{1, 2}));
}

}  // namespace

}  // namespace SsoClient::Access
