#include <memory>
#include <set>
#include <string>

#include <gtest/gtest.h>

#include <ssoclient/access/verdict.h>
#include <tarnik/core/exception.h>

#include "support/issued_token.h"

namespace SsoClient::Access::Testing {
namespace {

TEST(VerdictTest, AcceptedByAProgram) {
  const auto token = std::make_shared<IssuedToken>("_1", 0, 1);
  const Verdict verdict = Verdict::Accept(token);
  EXPECT_TRUE(verdict.IsAccepted());
  EXPECT_EQ(verdict.Token(), token);
  EXPECT_EQ(verdict.Refusal(), Reason::kNone);
  EXPECT_EQ(verdict.Message(), "");
  ASSERT_EQ(verdict.Ledger().size(), 15U);
  for (const CheckRecord& record : verdict.Ledger()) {
    EXPECT_EQ(record.outcome, CheckOutcome::kPassed);
    EXPECT_EQ(record.compared, "");
  }
  EXPECT_THROW(static_cast<void>(Verdict::Accept(nullptr)), Tarnik::InvalidArgumentException);
}

TEST(VerdictTest, RefusedByAProgram) {
  const Verdict verdict = Verdict::Refuse(Reason::kExpired, "too\nlate" + std::string(5000, '!'));
  EXPECT_FALSE(verdict.IsAccepted());
  EXPECT_EQ(verdict.Token(), nullptr);
  EXPECT_EQ(verdict.Refusal(), Reason::kExpired);
  EXPECT_EQ(verdict.Message().rfind("too?late!", 0), 0U);
  EXPECT_EQ(verdict.Message().size(), 1000U);
  ASSERT_EQ(verdict.Ledger().size(), 15U);
  for (const CheckRecord& record : verdict.Ledger()) {
    EXPECT_EQ(record.outcome, CheckOutcome::kNotReached);
  }
  EXPECT_THROW(static_cast<void>(Verdict::Refuse(Reason::kNone, "x")),
               Tarnik::InvalidArgumentException);
}

TEST(VerdictTest, ToString) {
  const std::string refused = Verdict::Refuse(Reason::kExpired, "It is late.").ToString();
  EXPECT_EQ(refused.rfind("refused (expired): It is late.\n  size: not-reached\n", 0), 0U);
  const std::string last = "\n  predicate: not-reached\n";
  EXPECT_EQ(refused.substr(refused.size() - last.size()), last);
  const auto token = std::make_shared<IssuedToken>("_1", 0, 1);
  EXPECT_EQ(Verdict::Accept(token).ToString().rfind("accepted\n  size: passed\n", 0), 0U);
}

TEST(VerdictTest, NamesAreDistinct) {
  std::set<std::string> names;
  for (int i = 0; i <= static_cast<int>(CheckKind::kPredicate); ++i) {
    names.insert(NameOf(static_cast<CheckKind>(i)));
  }
  EXPECT_EQ(names.size(), 15U);
  names.clear();
  for (int i = 0; i <= static_cast<int>(Reason::kPredicateFailed); ++i) {
    names.insert(NameOf(static_cast<Reason>(i)));
  }
  EXPECT_EQ(names.size(), 23U);
  EXPECT_EQ(names.count("unknown"), 0U);
  EXPECT_STREQ(NameOf(CheckKind::kSignerKnown), "signer-known");
  EXPECT_STREQ(NameOf(Reason::kWrongAudience), "wrong-audience");
  EXPECT_STREQ(NameOf(CheckOutcome::kNotReached), "not-reached");
  EXPECT_STREQ(NameOf(static_cast<Reason>(99)), "unknown");
}

TEST(VerdictTest, Remedies) {
  for (int i = 1; i <= static_cast<int>(Reason::kPredicateFailed); ++i) {
    const auto reason = static_cast<Reason>(i);
    const bool isService =
        reason == Reason::kRevocationUnknown || reason == Reason::kPredicateFailed;
    const bool isAccess = reason == Reason::kNotInGroup || reason == Reason::kRefusedByPredicate;
    EXPECT_EQ(RemedyOf(reason), isService  ? Remedy::kService
                                : isAccess ? Remedy::kAccess
                                           : Remedy::kNewToken);
  }
  EXPECT_EQ(RemedyOf(Reason::kNone), Remedy::kNone);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
