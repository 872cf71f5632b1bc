#include "wire/wire_answer.h"

#include <ctime>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace DevSts::Testing {
namespace {

using testing::HasSubstr;
using testing::Not;

// The example of RFC 9110, section 5.6.7.
constexpr std::time_t kNow = 784111777;
constexpr char kDate[] = "\r\nDate: Sun, 06 Nov 1994 08:49:37 GMT\r\n";

std::string Head(const Misbehavior& misbehavior, std::time_t now = kNow) {
  const WireAnswer answer = MakeWireAnswer({}, misbehavior, true, now);
  return answer.octets.substr(0, answer.headSize);
}

TEST(WireAnswerTest, HasTheDate) {
  EXPECT_THAT(Head({}), HasSubstr(kDate));
  EXPECT_THAT(Head({}, 0), HasSubstr("\r\nDate: Thu, 01 Jan 1970 00:00:00 GMT\r\n"));
  EXPECT_THAT(Head({}, 4107542399), HasSubstr("\r\nDate: Sun, 28 Feb 2100 23:59:59 GMT\r\n"));
}

TEST(WireAnswerTest, ADateOfTheMisbehaviourReplacesIt) {
  Misbehavior misbehavior;
  misbehavior.extraHeaders = {{"date", "yesterday"}};
  EXPECT_THAT(Head(misbehavior), HasSubstr("\r\ndate: yesterday\r\n"));
  EXPECT_THAT(Head(misbehavior), Not(HasSubstr("Date:")));
}

TEST(WireAnswerTest, TheDateIsOmittedOnRequest) {
  Misbehavior misbehavior;
  misbehavior.omitDate = true;
  EXPECT_THAT(Head(misbehavior), Not(HasSubstr("Date:")));
}

TEST(WireAnswerTest, AWholeAnswerIsSentWithoutADate) {
  Misbehavior misbehavior;
  misbehavior.httpAnswer = HttpAnswer{};
  EXPECT_THAT(Head(misbehavior), Not(HasSubstr("Date:")));
}

}  // namespace
}  // namespace DevSts::Testing
