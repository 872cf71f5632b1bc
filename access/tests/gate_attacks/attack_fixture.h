#ifndef SSOCLIENT_ACCESS_TESTS_GATE_ATTACKS_ATTACK_FIXTURE_H
#define SSOCLIENT_ACCESS_TESTS_GATE_ATTACKS_ATTACK_FIXTURE_H

#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include "gate/gate_fixture.h"

namespace SsoClient::Access::Testing {

/// A gate with a real trust store, which does not watch its files.
class AttackFixture : public ::testing::Test {
 protected:
  AttackFixture();

  /// Trusts these certificates for `kTokenIssuer`, from now on.
  void Trust(std::vector<Tarnik::Ref<const Tarnik::Crypto::Certificate>> certificates);
  /// A gate with the present configuration, which checks with its own cache.
  std::shared_ptr<TokenGate> Make() const { return CreateTokenGate(config); }
  Verdict Check(const std::string& token, const Presenter& presenter = Presenter::Nobody()) const {
    return Make()->Check(token, presenter);
  }
  static std::string Signed(const AssertionText& token) {
    return token.ToSignedXml(TrustedCredential());
  }
  AssertionText HolderOfKeyText() const {
    return AssertionText(text).ConfirmByKey(HolderCredential().certificatePem);
  }

  const Tarnik::System::DateTime start = Tarnik::System::GetUtcDateTime();
  /// What the gate's clock returns.
  Tarnik::System::DateTime now = start;
  const AssertionText text{start};
  GateConfig config;
};

/// A presenter that has the key of `credential`, and sends a signature of `signedData` as one of
/// `data`.
Presenter Signing(const std::string& data, const std::string& signedData,
                  const DevSts::Credential& credential,
                  Tarnik::Crypto::SignatureAlgorithm algorithm =
                      Tarnik::Crypto::SignatureAlgorithm::kEcdsaSha256);
Presenter WithTls(const DevSts::Credential& credential);

}  // namespace SsoClient::Access::Testing

#endif
