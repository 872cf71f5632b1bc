#include "transport/exchange_outcome.h"

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>

#include "transport/fake_http.h"
#include "transport/read_all.h"

namespace SsoClient::Testing {
namespace {

TEST(ExchangeOutcomeTest, AFailureKeepsItsMessage) {
  const auto outcome = InterpretFailure(Tarnik::TimeoutException("No answer in time."));
  EXPECT_EQ(outcome.body, nullptr);
  ASSERT_TRUE(outcome.failure);
  EXPECT_EQ(outcome.failure->Message(), "No answer in time.");
}

TEST(ExchangeOutcomeTest, StatusCodes200To299And500AreAnswers) {
  for (const int code : {200, 201, 202, 204, 250, 299, 500}) {
    const auto response = Tarnik::MakeRef<FakeResponse>(code, "Any", "the body");
    const auto outcome = InterpretResponse(*response);
    EXPECT_FALSE(outcome.failure) << code;
    ASSERT_NE(outcome.body, nullptr) << code;
    EXPECT_EQ(outcome.body, response->Body());
    EXPECT_EQ(ReadAll(*outcome.body), "the body");
  }
}

TEST(ExchangeOutcomeTest, AnyOtherStatusIsAFailureThatNamesIt) {
  const struct {
    int code;
    const char* reason;
    const char* message;
  } kCases[] = {
      {100, "Continue", "Server returned error: 100 Continue"},
      {199, "Odd", "Server returned error: 199 Odd"},
      {300, "Multiple Choices", "Server returned error: 300 Multiple Choices"},
      {301, "Moved Permanently", "Server returned error: 301 Moved Permanently"},
      {302, "Found", "Server returned error: 302 Found"},
      {303, "See Other", "Server returned error: 303 See Other"},
      {304, "Not Modified", "Server returned error: 304 Not Modified"},
      {307, "Temporary Redirect", "Server returned error: 307 Temporary Redirect"},
      {308, "Permanent Redirect", "Server returned error: 308 Permanent Redirect"},
      {400, "Bad Request", "Server returned error: 400 Bad Request"},
      {404, "Not Found", "Server returned error: 404 Not Found"},
      {499, "", "Server returned error: 499 "},
      {501, "Not Implemented", "Server returned error: 501 Not Implemented"},
      {503, "Service Unavailable", "Server returned error: 503 Service Unavailable"},
      {999, "Last", "Server returned error: 999 Last"},
  };
  for (const auto& test : kCases) {
    const auto outcome = InterpretResponse(*Tarnik::MakeRef<FakeResponse>(test.code, test.reason));
    EXPECT_EQ(outcome.body, nullptr);
    ASSERT_TRUE(outcome.failure) << test.code;
    EXPECT_EQ(outcome.failure->Message(), test.message);
  }
}

TEST(ExchangeOutcomeTest, TheReasonOfAStatusIsBoundedAndCleaned) {
  const auto messageFor = [](const std::string& reason) {
    return InterpretResponse(*Tarnik::MakeRef<FakeResponse>(503, reason)).failure->Message();
  };
  EXPECT_EQ(messageFor("Größe"), "Server returned error: 503 Größe");
  EXPECT_EQ(messageFor("a\x1b[2J\tb\xff"), "Server returned error: 503 a?[2J?b?");
  EXPECT_EQ(messageFor(std::string(60000, 'x')),
            "Server returned error: 503 " + std::string(256, 'x') + "...");
}

TEST(ExchangeOutcomeTest, AFailureToReadTheResponseIsAFailureOfTheExchange) {
  const auto response = Tarnik::MakeRef<FakeResponse>(200, "OK");
  response->bodyFailure = "The body is gone.";
  const auto outcome = InterpretResponse(*response);
  EXPECT_EQ(outcome.body, nullptr);
  ASSERT_TRUE(outcome.failure);
  EXPECT_EQ(outcome.failure->Message(), "The body is gone.");
}

}  // namespace
}  // namespace SsoClient::Testing
