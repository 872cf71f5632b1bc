// A service that repeats the password in its answers.
#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "secret_text.h"
#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Limit = Tarnik::Http::CallLimit;

template <class Exception>
Script::Function Repeats(FailureKind kind) {
  return [kind](const AttemptRequest& request, Limit&) {
    auto outcome = Failed<Exception>(kind, "no user with [" + request.secret + "]");
    // As the client of an endpoint does.
    outcome.message = ToRecordText(HideSecret(outcome.message, request.secret));
    return outcome;
  };
}

class SecretEchoTest : public SourceFixture, public ::testing::WithParamInterface<std::size_t> {
 protected:
  SecretEchoTest() {
    static const std::string kPattern = "&Q;7<\"#";
    password.clear();
    while (password.size() < GetParam()) {
      password += kPattern;
    }
    password.resize(GetParam());
  }

  bool Contains(const std::string& text) const { return text.find(password) != std::string::npos; }
  void ExpectNoRecordContainsIt() {
    for (const AttemptRecord& record : listener->Ended()) {
      EXPECT_FALSE(Contains(record.message)) << record.message;
      EXPECT_LE(record.message.size(), 1000U);
    }
    for (const RefreshFailureRecord& record : listener->Refreshes()) {
      EXPECT_FALSE(Contains(record.message)) << record.message;
      EXPECT_LE(record.message.size(), 1000U);
    }
  }
};

TEST_P(SecretEchoTest, RememberedRefusalDoesNotContainIt) {
  ForAll(Repeats<InvalidCredentialsException>(FailureKind::kRefusedLogin));
  Make();
  const Reply first = Get(spec);
  // The exception of the client, unchanged.
  EXPECT_TRUE(first.Is<InvalidCredentialsException>());
  EXPECT_EQ(first.Message(), "no user with [" + password + "]");
  const Reply later = Get(spec);
  EXPECT_TRUE(later.Is<InvalidCredentialsException>());
  EXPECT_EQ(later.Message(), "no user with [***]");
  EXPECT_EQ(Attempts(), 1U);
  ExpectNoRecordContainsIt();
}

TEST_P(SecretEchoTest, EachClassOfARefusalIsKept) {
  ForAll(Repeats<PasswordExpiredException>(FailureKind::kExpiredPassword));
  Make();
  Get(spec);
  EXPECT_TRUE(Get(spec).Is<PasswordExpiredException>());
  source->Stop(milliseconds(0));
  ForAll(Repeats<CommunicationException>(FailureKind::kRefusedLogin));
  Make();
  Get(spec);
  EXPECT_TRUE(Get(spec).Is<CommunicationException>());
  EXPECT_FALSE(Contains(Get(spec).Message()));
}

TEST_P(SecretEchoTest, SummaryDoesNotContainIt) {
  config.retry.failuresToOpen = 2;
  ForAll(Repeats<CommunicationException>(FailureKind::kHttpStatus));
  Make();
  const auto reply = Ask(spec);
  runtime->Advance(minutes(5));
  EXPECT_EQ(reply->Message(),
            "No endpoint has given a token. https://a.example.com/sts: http-status: no user with "
            "[***] https://b.example.com/sts: http-status: no user with [***]");
  // The endpoints are left out.
  const Reply second = Get(spec);
  EXPECT_FALSE(Contains(second.Message())) << second.Message();
  ExpectNoRecordContainsIt();
}

TEST_P(SecretEchoTest, DeadlineDoesNotRepeatIt) {
  config.retry.firstDelay = minutes(1);
  ForAll(Repeats<CommunicationException>(FailureKind::kHttpStatus));
  Make();
  const auto reply = Ask(spec, Within(seconds(1)));
  runtime->Advance(seconds(1));
  EXPECT_EQ(reply->Message(),
            "The deadline passed while the call was waiting for the next attempt. The last attempt "
            "had failed: no user with [***]");
}

TEST_P(SecretEchoTest, RefreshFailureDoesNotContainIt) {
  config.endpoints.resize(1);
  config.keepFresh = {spec};
  ForAll(Repeats<SsoException>(FailureKind::kFault));
  Make();
  runtime->Advance(minutes(10));
  ASSERT_FALSE(listener->Refreshes().empty());
  EXPECT_EQ(listener->Refreshes()[0].message, "no user with [***]");
  ExpectNoRecordContainsIt();
}

INSTANTIATE_TEST_SUITE_P(Sizes, SecretEchoTest, ::testing::Values(1, 2, 7, 100, 65536));

}  // namespace

}  // namespace SsoClient::Access::Testing
