#include <gtest/gtest.h>

#include <ssoclient/access/listener.h>

namespace SsoClient::Access {
namespace {

TEST(ListenerTest, OperationsHaveNames) {
  EXPECT_STREQ(NameOf(AttemptOperation::kLogin), "login");
  EXPECT_STREQ(NameOf(AttemptOperation::kRenewal), "renewal");
  EXPECT_STREQ(NameOf(AttemptOperation::kExchange), "exchange");
  EXPECT_STREQ(NameOf(static_cast<AttemptOperation>(9)), "unknown");
}

TEST(ListenerTest, StatesOfCircuitsHaveNames) {
  EXPECT_STREQ(NameOf(CircuitState::kClosed), "closed");
  EXPECT_STREQ(NameOf(CircuitState::kOpen), "open");
  EXPECT_STREQ(NameOf(CircuitState::kHalfOpen), "half-open");
  EXPECT_STREQ(NameOf(static_cast<CircuitState>(9)), "unknown");
}

}  // namespace
}  // namespace SsoClient::Access
