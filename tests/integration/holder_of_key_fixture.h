#ifndef SSOCLIENT_TESTS_INTEGRATION_HOLDER_OF_KEY_FIXTURE_H
#define SSOCLIENT_TESTS_INTEGRATION_HOLDER_OF_KEY_FIXTURE_H

#include <chrono>
#include <memory>
#include <string>
#include <vector>

#include <devsts/certificates.h>

#include "integration/sts_fixture.h"

namespace SsoClient::Testing {

/// A solution user of the dev STS, also known by the certificate of `Holder()`.
inline constexpr char kMachine[] = "machine@EXAMPLE.COM";
inline constexpr char kMachinePassword[] = "machine-secret";

/// The client's RSA key and certificate.
const DevSts::Credential& Holder();
/// Another key and certificate, which belong to no user.
const DevSts::Credential& Stranger();

/// A new RSA certificate of the key of `Holder()`, valid between these times from now.
DevSts::Credential HolderValidBetween(std::chrono::seconds notBefore,
                                      std::chrono::seconds notAfter);

/// Like `MakeService`, with the credential as holder-of-key configuration.
std::shared_ptr<SecurityTokenService> MakeHolderService(const DevSts::Server& server,
                                                        const std::string& url,
                                                        const DevSts::Credential& credential);

/// A spec for ten minutes and a token that may be renewed and delegated.
TokenSpec RenewableAndDelegable();

/// A spec for ten minutes and a bearer token.
TokenSpec Bearer();

/// The names of the token's delegates, in order.
std::vector<std::string> ChainOf(const SamlToken& token);

/// True when the token is bound to the credential's certificate, octet for octet.
bool IsBoundTo(const SamlToken& token, const DevSts::Credential& credential);

/// With these options tokens begin and end at these times from now, whatever is requested.
DevSts::AssertionOptions ValidBetween(std::chrono::seconds start, std::chrono::seconds end);

class HolderOfKeyTest : public StsTest {
 protected:
  HolderOfKeyTest() { Sts().RegisterCertificate(kMachine, Holder().certificatePem); }

  static std::shared_ptr<SecurityTokenService> HolderService(
      const DevSts::Credential& credential = Holder()) {
    return MakeHolderService(Sts(), Sts().HttpsUrl(), credential);
  }
  /// A holder-of-key token of `kUser`.
  static std::shared_ptr<const SamlToken> AcquireBound(
      const TokenSpec& spec = RenewableAndDelegable()) {
    return HolderService()->AcquireToken(kUser, kPassword, spec);
  }
  /// A bearer token of `kUser` that may be delegated.
  static std::shared_ptr<const SamlToken> DelegableBearer() {
    TokenSpec spec = Bearer();
    spec.delegable = true;
    return Acquire(spec);
  }
};

}  // namespace SsoClient::Testing

#endif
