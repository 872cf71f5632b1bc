#include <algorithm>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

class RefreshLimitTest : public SourceFixture {};

// The first endpoint becomes silent. The second one is asked before the token ends.
TEST_F(RefreshLimitTest, AttemptToRefreshIsShorterThanTheRestOfTheToken) {
  ForAll(Issues(seconds(10)));
  Make();
  ASSERT_NE(Get(spec).token, nullptr);
  std::vector<milliseconds> limits;
  scripts[0]->Set([&](const AttemptRequest&, Tarnik::Http::CallLimit& limit) {
    const auto left =
        std::chrono::duration_cast<milliseconds>(limit.Deadline() - runtime->Now().steady);
    limits.push_back(left);
    runtime->Pass(left);
    return Failed<CommunicationException>(FailureKind::kTimedOut, "It is silent.");
  });
  for (int i = 0; i < 300; ++i) {
    EXPECT_NE(source->TryGetToken(spec), nullptr) << i;
    runtime->Advance(milliseconds(100));
  }
  ASSERT_FALSE(limits.empty());
  EXPECT_LT(limits.front(), seconds(2));
  EXPECT_GE(*std::min_element(limits.begin(), limits.end()), seconds(1));
}

// A token of an hour leaves time for the whole limit of an attempt.
TEST_F(RefreshLimitTest, LongLivedTokensLeaveTheWholeLimit) {
  ForAll(Issues(std::chrono::hours(1)));
  Make();
  ASSERT_NE(Get(spec).token, nullptr);
  ASSERT_NE(source->TryGetToken(spec), nullptr);
  milliseconds left{0};
  ForAll([&](const AttemptRequest&, Tarnik::Http::CallLimit& limit) {
    left = std::chrono::duration_cast<milliseconds>(limit.Deadline() - runtime->Now().steady);
    return Issued(NewToken(std::chrono::hours(1)));
  });
  runtime->Advance(minutes(52));
  EXPECT_EQ(left, config.retry.attemptTimeout);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
