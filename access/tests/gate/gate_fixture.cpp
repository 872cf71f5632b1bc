#include "gate/gate_fixture.h"

#include <algorithm>

namespace SsoClient::Access::Testing {
namespace {

DevSts::Credential NewHolder() {
  DevSts::CertificateSpec spec;
  spec.commonName = "holder";
  spec.freshKey = true;
  return DevSts::MakeCertificate(spec);
}

bool IsRecordText(const std::string& text) {
  return text.size() <= 1000 && std::none_of(text.begin(), text.end(), [](char c) {
           return static_cast<unsigned char>(c) < 0x20 || c == 0x7F;
         });
}

CheckOutcome OutcomeOf(CheckKind check, CheckKind failed) {
  if (check == failed) {
    return CheckOutcome::kFailed;
  }
  return check < failed ? CheckOutcome::kPassed : CheckOutcome::kNotReached;
}

}  // namespace

Tarnik::System::DateTime After(const Tarnik::System::DateTime& time,
                               std::chrono::microseconds duration) {
  return Tarnik::System::DateTimeFromUtc(time.GetUtcTime() + duration.count(), false);
}

const DevSts::Credential& HolderCredential() {
  static const DevSts::Credential credential = NewHolder();
  return credential;
}

const DevSts::Credential& OtherHolderCredential() {
  static const DevSts::Credential credential = NewHolder();
  return credential;
}

Tarnik::Ref<const Tarnik::Crypto::Certificate> CertificateOf(const DevSts::Credential& credential) {
  return Tarnik::Crypto::CreateCertificatesFromPem(credential.certificatePem).front();
}

CheckRecord RecordOf(const Verdict& verdict, CheckKind check) {
  return verdict.Ledger().at(static_cast<std::size_t>(check));
}

void ExpectAccepted(const Verdict& verdict) {
  EXPECT_TRUE(verdict.IsAccepted()) << verdict.ToString();
  EXPECT_NE(verdict.Token(), nullptr);
  EXPECT_EQ(verdict.Refusal(), Reason::kNone);
  EXPECT_EQ(verdict.Message(), "");
  const std::vector<CheckRecord> ledger = verdict.Ledger();
  ASSERT_EQ(ledger.size(), 15U);
  for (std::size_t i = 0; i < ledger.size(); ++i) {
    EXPECT_EQ(ledger[i].check, static_cast<CheckKind>(i));
    EXPECT_EQ(ledger[i].outcome, CheckOutcome::kPassed) << NameOf(ledger[i].check);
    EXPECT_FALSE(ledger[i].compared.empty()) << NameOf(ledger[i].check);
    EXPECT_TRUE(IsRecordText(ledger[i].compared)) << ledger[i].compared;
  }
}

void ExpectRefused(const Verdict& verdict, Reason reason, CheckKind failed) {
  EXPECT_FALSE(verdict.IsAccepted());
  EXPECT_EQ(verdict.Token(), nullptr);
  EXPECT_EQ(verdict.Refusal(), reason) << verdict.ToString();
  EXPECT_NE(verdict.Message(), "");
  EXPECT_TRUE(IsRecordText(verdict.Message())) << verdict.Message();
  const std::vector<CheckRecord> ledger = verdict.Ledger();
  ASSERT_EQ(ledger.size(), 15U);
  for (std::size_t i = 0; i < ledger.size(); ++i) {
    EXPECT_EQ(ledger[i].check, static_cast<CheckKind>(i));
    EXPECT_EQ(ledger[i].outcome, OutcomeOf(ledger[i].check, failed)) << NameOf(ledger[i].check);
    EXPECT_EQ(ledger[i].compared.empty(), ledger[i].check > failed) << NameOf(ledger[i].check);
    EXPECT_TRUE(IsRecordText(ledger[i].compared)) << ledger[i].compared;
  }
}

GateFixture::GateFixture() {
  trust->Set({{kTokenIssuer, {SignerOf(TrustedCredential())}}});
  config.trust = trust;
  config.audiences = {kAudience};
  config.bearerTokens = BearerTokens::kAccept;
  config.clock = [this] { return now; };
}

AssertionText GateFixture::HolderOfKeyText() const {
  return AssertionText(text).ConfirmByKey(HolderCredential().certificatePem);
}

}  // namespace SsoClient::Access::Testing
