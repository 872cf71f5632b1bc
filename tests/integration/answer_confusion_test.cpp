// Answers that belong to another operation, and answers that were changed in transit.
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <tuple>
#include <typeinfo>

#include <gtest/gtest.h>

#include "integration/holder_of_key_fixture.h"
#include "integration/operation.h"

namespace SsoClient::Testing {
namespace {

class AnswerConfusionTest : public HolderOfKeyTest,
                            public testing::WithParamInterface<std::tuple<Operation, Operation>> {
 protected:
  /// The service's genuine answer.
  static std::string AnswerTo(Operation operation, const Arguments& arguments) {
    auto answer = std::make_shared<std::string>();
    DevSts::Misbehavior listening;
    listening.editEnvelope = [answer](std::string& envelope) { *answer = envelope; };
    Sts().MisbehaveNext(listening);
    EXPECT_TRUE(CallNow(operation, *HolderService(), arguments).IsSuccess());
    return *answer;
  }
};

// Three of the four operations that return a token have the same kind of answer.
bool IsAnsweredAlike(Operation one, Operation other) {
  const auto issues = [](Operation operation) {
    return operation != Operation::Renew && operation != Operation::Validate;
  };
  return one == other || (issues(one) && issues(other));
}

TEST_P(AnswerConfusionTest, OnlyAnAnswerOfTheSameKindIsAccepted) {
  const auto [asked, answered] = GetParam();
  Arguments arguments;
  arguments.token = AcquireBound();
  DevSts::Misbehavior misbehavior;
  misbehavior.httpAnswer = DevSts::HttpAnswer{200, "OK", {}, AnswerTo(answered, arguments)};
  Sts().SetMisbehavior(misbehavior);
  const Outcome outcome = CallNow(asked, *HolderService(), arguments);
  if (IsAnsweredAlike(asked, answered)) {
    EXPECT_TRUE(outcome.IsSuccess()) << outcome.message;
    return;
  }
  EXPECT_EQ(outcome.errorClass, typeid(SsoException));
  EXPECT_EQ(outcome.message, "Unexpected XML format");
  EXPECT_EQ(outcome.token, nullptr);
  EXPECT_EQ(outcome.verdict, std::nullopt);
}

INSTANTIATE_TEST_SUITE_P(EveryPair, AnswerConfusionTest,
                         testing::Combine(testing::ValuesIn(kOperations),
                                          testing::ValuesIn(kOperations)),
                         [](const auto& tested) {
                           return std::string(NameOf(std::get<0>(tested.param))) + "AnsweredAs" +
                                  NameOf(std::get<1>(tested.param));
                         });

struct VerdictCase {
  const char* name;
  const char* code;
};

class VerdictTextTest : public HolderOfKeyTest, public testing::WithParamInterface<VerdictCase> {};

// A verdict is exactly one of two URIs; anything similar is not a verdict.
TEST_P(VerdictTextTest, IsNotAVerdict) {
  Arguments arguments;
  arguments.token = AcquireBound();
  DevSts::Misbehavior misbehavior;
  misbehavior.editEnvelope = [](std::string& envelope) {
    constexpr std::string_view kValid =
        "http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/valid";
    envelope.replace(envelope.find(kValid), kValid.size(), GetParam().code);
  };
  Sts().SetMisbehavior(misbehavior);
  const Outcome outcome = CallNow(Operation::Validate, *HolderService(), arguments);
  EXPECT_EQ(outcome.verdict, std::nullopt);
  EXPECT_EQ(outcome.errorClass, typeid(SsoException));
  EXPECT_EQ(outcome.message, "Unexpected XML format");
}

INSTANTIATE_TEST_SUITE_P(
    Codes, VerdictTextTest,
    testing::Values(
        VerdictCase{"Empty", ""}, VerdictCase{"Bare", "valid"},
        VerdictCase{"OtherCase", "http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/Valid"},
        VerdictCase{"Blank", " http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/valid"},
        VerdictCase{"Longer", "http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/valid/"},
        VerdictCase{
            "Comment",
            "<!-- -->x<!-- -->http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/valid"}),
    [](const auto& tested) { return tested.param.name; });

}  // namespace
}  // namespace SsoClient::Testing
