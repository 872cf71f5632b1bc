// The instants at which verdicts change, to the microsecond.
#include <limits>
#include <stdexcept>

#include "gate/gate_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using std::chrono::hours;
using std::chrono::microseconds;
using std::chrono::seconds;

constexpr seconds kTolerance{300};
constexpr microseconds kInstant{1};

class GateTimesTest : public GateFixture {
 protected:
  GateTimesTest() {
    // Of the signer nothing ends while the token is valid.
    signer.notBefore = After(start, hours(-100));
    signer.notAfter = After(start, hours(100));
    Trust(signer);
  }

  Reason ReasonAt(const Tarnik::System::DateTime& time) {
    now = time;
    const Reason fresh = Check(token).Refusal();
    EXPECT_EQ(Remembering().Check(token, Presenter::Nobody()).Refusal(), fresh);
    return fresh;
  }
  // A gate that remembers the token, with the trust and tolerance of now.
  const TokenGate& Remembering() {
    const auto current = now;
    const Signer changed = signer;
    now = start;
    remembering_ = Make();
    EXPECT_TRUE(remembering_->Check(token, Presenter::Nobody()).IsAccepted());
    now = current;
    signer = changed;
    return *remembering_;
  }

  Signer signer = SignerOf(TrustedCredential());
  const std::string token = Signed(text);
  const Tarnik::System::DateTime begin = After(start, seconds(-60));
  const Tarnik::System::DateTime end = After(start, seconds(3600));

 private:
  std::shared_ptr<TokenGate> remembering_;
};

TEST_F(GateTimesTest, BeginOfToken) {
  EXPECT_EQ(ReasonAt(After(begin, -kTolerance - kInstant)), Reason::kNotYetValid);
  EXPECT_EQ(ReasonAt(After(begin, -kTolerance)), Reason::kNone);
  config.clockTolerance = seconds(0);
  EXPECT_EQ(ReasonAt(After(begin, -kInstant)), Reason::kNotYetValid);
  EXPECT_EQ(ReasonAt(begin), Reason::kNone);
}

TEST_F(GateTimesTest, EndOfToken) {
  EXPECT_EQ(ReasonAt(After(end, kTolerance - kInstant)), Reason::kNone);
  EXPECT_EQ(ReasonAt(After(end, kTolerance)), Reason::kExpired);
  config.clockTolerance = seconds(0);
  EXPECT_EQ(ReasonAt(After(end, -kInstant)), Reason::kNone);
  EXPECT_EQ(ReasonAt(end), Reason::kExpired);
}

// It may end before the token does.
TEST_F(GateTimesTest, EndOfConfirmation) {
  const auto confirmed = After(start, seconds(600));
  AssertionText changed = HolderOfKeyText();
  changed.subject = Replaced(changed.subject, end.ToString(), confirmed.ToString());
  const std::string holderOfKey = Signed(changed);
  const auto holder = Presenter::WithTlsCertificate(CertificateOf(HolderCredential()));
  const auto gate = Make();
  ExpectAccepted(gate->Check(holderOfKey, holder));
  now = After(confirmed, kTolerance - kInstant);
  ExpectAccepted(gate->Check(holderOfKey, holder));
  EXPECT_EQ(gate->Metrics().cacheHits, 1U);
  now = After(confirmed, kTolerance);
  ExpectRefused(gate->Check(holderOfKey, holder), Reason::kExpired, CheckKind::kValidity);
  const Verdict verdict = Check(holderOfKey, holder);
  ExpectRefused(verdict, Reason::kExpired, CheckKind::kValidity);
  EXPECT_NE(verdict.Message().find("can be confirmed until " + confirmed.ToString()),
            std::string::npos);
}

TEST_F(GateTimesTest, BeginOfSigner) {
  signer.notBefore = start;
  Trust(signer);
  EXPECT_EQ(ReasonAt(After(start, -kTolerance)), Reason::kNone);
  EXPECT_EQ(ReasonAt(After(start, -kTolerance - kInstant)), Reason::kSignerNotYetValid);
}

// A certificate is valid through its last second.
TEST_F(GateTimesTest, EndOfSigner) {
  signer.notAfter = start;
  Trust(signer);
  EXPECT_EQ(ReasonAt(After(start, kTolerance)), Reason::kNone);
  EXPECT_EQ(ReasonAt(After(start, kTolerance + kInstant)), Reason::kSignerExpired);
}

TEST_F(GateTimesTest, PeriodOfRevocationList) {
  signer.isRevocationChecked = true;
  signer.listFrom = start;
  signer.listUntil = After(start, seconds(60));
  Trust(signer);
  EXPECT_EQ(ReasonAt(After(start, -kTolerance - kInstant)), Reason::kRevocationUnknown);
  EXPECT_EQ(ReasonAt(After(start, -kTolerance)), Reason::kNone);
  EXPECT_EQ(ReasonAt(After(start, seconds(60) + kTolerance - kInstant)), Reason::kNone);
  EXPECT_EQ(ReasonAt(After(start, seconds(60) + kTolerance)), Reason::kRevocationUnknown);
}

TEST_F(GateTimesTest, LongestLifetime) {
  AssertionText changed(After(start, kInstant));
  changed.conditions =
      Replaced(changed.conditions, SsoClient::Testing::TimeText(After(start, kInstant), -60),
               SsoClient::Testing::TimeText(start, -60));
  config.longestLifetime = seconds(3660);
  ExpectRefused(Check(changed), Reason::kTooLongLived, CheckKind::kLifetime);
  ExpectAccepted(Check(token));
}

TEST_F(GateTimesTest, LargestTolerance) {
  config.clockTolerance = std::chrono::seconds::max();
  config.longestLifetime = std::chrono::seconds::max();
  EXPECT_EQ(ReasonAt(After(end, hours(24 * 365 * 900))), Reason::kNone);
  now = Tarnik::System::DateTimeFromUtc(std::numeric_limits<long>::max(), false);
  ExpectRefused(Check(token), Reason::kExpired, CheckKind::kValidity);
  now = Tarnik::System::DateTimeFromUtc(std::numeric_limits<long>::min(), false);
  ExpectRefused(Check(token), Reason::kNotYetValid, CheckKind::kValidity);
}

TEST_F(GateTimesTest, ClockThatIsSetBackAndForth) {
  const auto gate = Make();
  const auto reasonAfter = [&](hours passed) {
    now = After(start, passed);
    return gate->Check(token, Presenter::Nobody()).Refusal();
  };
  EXPECT_EQ(reasonAfter(hours(0)), Reason::kNone);
  EXPECT_EQ(reasonAfter(hours(-1)), Reason::kNotYetValid);
  EXPECT_EQ(reasonAfter(hours(0)), Reason::kNone);
  EXPECT_EQ(reasonAfter(hours(2)), Reason::kExpired);
  EXPECT_EQ(reasonAfter(hours(0)), Reason::kNone);
}

TEST_F(GateTimesTest, ExceptionsOfTheClockPassThrough) {
  config.clock = []() -> Tarnik::System::DateTime { throw std::runtime_error("no clock"); };
  EXPECT_THROW(static_cast<void>(Check(token)), std::runtime_error);
}

TEST_F(GateTimesTest, SystemClock) {
  config.clock = nullptr;
  ExpectAccepted(Check(token));
}

}  // namespace
}  // namespace SsoClient::Access::Testing
