#ifndef SSOCLIENT_ACCESS_TESTS_GATE_GATE_FIXTURE_H
#define SSOCLIENT_ACCESS_TESTS_GATE_GATE_FIXTURE_H

#include <chrono>
#include <memory>
#include <string>

#include <gtest/gtest.h>

#include <devsts/certificates.h>
#include <ssoclient/access/token_gate.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>

#include "gate/fake_trust.h"
#include "support/assertion_text.h"

namespace SsoClient::Access::Testing {

using SsoClient::Testing::AssertionText;
using SsoClient::Testing::InsertedAfter;
using SsoClient::Testing::Replaced;
using SsoClient::Testing::StrangerCredential;
using SsoClient::Testing::TrustedCredential;

inline constexpr const char* kTokenIssuer = "https://sts.example.com/STS";
inline constexpr const char* kAudience = "https://a.example";

Tarnik::System::DateTime After(const Tarnik::System::DateTime& time,
                               std::chrono::microseconds duration);

/// The holder of the key of the tests' holder-of-key tokens, and somebody else.
const DevSts::Credential& HolderCredential();
const DevSts::Credential& OtherHolderCredential();
Tarnik::Ref<const Tarnik::Crypto::Certificate> CertificateOf(const DevSts::Credential& credential);

/// The record of one check.
CheckRecord RecordOf(const Verdict& verdict, CheckKind check);

/// Expects an accepted token, whose checks have all passed.
void ExpectAccepted(const Verdict& verdict);
/// Expects a refusal for this reason: the checks before this one have passed, and those after it
/// were not reached.
void ExpectRefused(const Verdict& verdict, Reason reason, CheckKind failed);

/// A gate for the tokens of the trusted credential, with a clock that the test sets. It accepts
/// bearer tokens.
class GateFixture : public ::testing::Test {
 protected:
  GateFixture();

  std::shared_ptr<TokenGate> Make() const { return CreateTokenGate(config); }
  /// Checks with a gate of its own.
  Verdict Check(const std::string& token, const Presenter& presenter = Presenter::Nobody()) const {
    return Make()->Check(token, presenter);
  }
  Verdict Check(const AssertionText& token,
                const Presenter& presenter = Presenter::Nobody()) const {
    return Check(Signed(token), presenter);
  }
  static std::string Signed(const AssertionText& token) {
    return token.ToSignedXml(TrustedCredential());
  }
  AssertionText HolderOfKeyText() const;
  /// Trusts this signer in place of the others.
  void Trust(const Signer& signer) { trust->Set({{kTokenIssuer, {signer}}}); }

  const Tarnik::System::DateTime start = Tarnik::System::GetUtcDateTime();
  /// What the gate's clock returns.
  Tarnik::System::DateTime now = start;
  const std::shared_ptr<FakeTrust> trust = std::make_shared<FakeTrust>();
  const AssertionText text{start};
  GateConfig config;
};

}  // namespace SsoClient::Access::Testing

#endif
