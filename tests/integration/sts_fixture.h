#ifndef SSOCLIENT_TESTS_INTEGRATION_STS_FIXTURE_H
#define SSOCLIENT_TESTS_INTEGRATION_STS_FIXTURE_H

#include <memory>
#include <string>
#include <typeinfo>

#include <boost/none.hpp>
#include <boost/optional.hpp>
#include <gtest/gtest.h>

#include <devsts/server.h>
#include <ssoclient/ssoclient.h>
#include <tarnik/crypto/certificate.h>

namespace SsoClient::Testing {

inline constexpr char kUser[] = "alice@EXAMPLE.COM";
inline constexpr char kPassword[] = "secret";

/// The namespaces of the fault codes of WS-Trust and WS-Security.
inline constexpr char kTrust[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512";
inline constexpr char kSecext[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";

/// TLS trust in the CA of `server`.
Tarnik::Ref<Tarnik::Ssl::SSLContext> TrustCa(const DevSts::Server& server);

/// A resolver that trusts only the first certificate of `pem`.
Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> TrustSigner(const std::string& pem);

/// A service for `url` that trusts `server`'s CA and signing key.
std::shared_ptr<SecurityTokenService> MakeService(
    const DevSts::Server& server, const std::string& url,
    const boost::optional<HolderOfKeyConfig>& holderOfKeyConfig = boost::none);

/// A spec for ten minutes that requests nothing else.
TokenSpec TenMinutes();

/// The message of the `Expected` that `action` throws. Another exception passes through; the test
/// fails if nothing is thrown.
template <class Expected, class Action>
std::string MessageOf(Action&& action) {
  try {
    action();
  } catch (const Expected& e) {
    EXPECT_EQ(typeid(e), typeid(Expected));
    return e.Message();
  }
  ADD_FAILURE() << "nothing was thrown";
  return {};
}

/// One dev STS for all tests of the process, well-behaved at the start of each test.
class StsTest : public testing::Test {
 protected:
  StsTest();

  static DevSts::Server& Sts();
  static std::shared_ptr<SecurityTokenService> Service() {
    return MakeService(Sts(), Sts().HttpsUrl());
  }
  static std::shared_ptr<const SamlToken> Acquire(const TokenSpec& spec = TenMinutes()) {
    return Service()->AcquireToken(kUser, kPassword, spec);
  }
};

}  // namespace SsoClient::Testing

#endif
