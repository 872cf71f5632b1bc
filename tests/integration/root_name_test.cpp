// Names with the full stop of the DNS root, over real TLS.
#include <cstring>
#include <memory>
#include <string>

#include <dlfcn.h>
#include <gmock/gmock.h>
#include <netdb.h>

#include <tarnik/http/connection_specs.h>
#include <tarnik/http/cookie_store.h>
#include <tarnik/http/http_user_agent.h>

#include "integration/sts_fixture.h"

namespace {

constexpr char kRootName[] = "sts.example.";

}  // namespace

// Replaces the look-up in the whole program: no name with the full stop of the root is sure to be
// known everywhere. The one of the tests is on the loopback interface.
extern "C" [[gnu::visibility("default")]] int getaddrinfo(const char* host, const char* port,
                                                          const addrinfo* hints, addrinfo** found) {
  static const auto lookUp =
      reinterpret_cast<decltype(&getaddrinfo)>(dlsym(RTLD_NEXT, "getaddrinfo"));
  const bool isRootName = host != nullptr && std::strcmp(host, kRootName) == 0;
  return lookUp(isRootName ? "127.0.0.1" : host, port, hints, found);
}

namespace SsoClient::Testing {
namespace {

using testing::HasSubstr;

class RootNameTest : public testing::Test {
 protected:
  static DevSts::ServerOptions NamedBy(const std::string& name) {
    DevSts::ServerOptions options;
    options.tls.certificate = DevSts::ServerCertificate::Custom;
    options.tls.dnsNames = {name};
    return options;
  }
  static std::shared_ptr<const SamlToken> Acquire(const SecurityTokenService& service) {
    return service.AcquireToken(kUser, kPassword, TenMinutes());
  }
  std::string HostField() const {
    return std::string(kRootName) + ":" + std::to_string(sts_.HttpsPort());
  }

  DevSts::Server sts_{NamedBy("sts.example")};
};

TEST_F(RootNameTest, WorksInAUrl) {
  EXPECT_NE(Acquire(*MakeService(sts_, sts_.HttpsUrlFor(kRootName))), nullptr);
  const auto request = sts_.LastRequest();
  EXPECT_EQ(request.Header("Host"), HostField());
  // Certificates and SNI do not have the full stop (RFC 6066, section 3).
  EXPECT_EQ(request.serverName, "sts.example");
}

TEST_F(RootNameTest, IsComparedWithTheCertificate) {
  for (const std::string name : {"other.example", "example", "*.sts.example"}) {
    const DevSts::Server other(NamedBy(name));
    const auto service = MakeService(other, other.HttpsUrlFor(kRootName));
    EXPECT_THAT(MessageOf<CommunicationException>([&] { Acquire(*service); }),
                HasSubstr("does not name 'sts.example"));
    EXPECT_TRUE(other.Requests().empty());
  }
}

TEST_F(RootNameTest, HasTheCookiesOfItsHost) {
  const auto spec =
      Tarnik::Http::CreateTLSConnectionSpec(kRootName, sts_.HttpsPort(), TrustCa(sts_).get(), "");
  const auto cookies = Tarnik::Http::CreateCookieStore("");
  SecurityTokenServiceConfigEx config;
  config.url = "/sts";
  config.userAgent = Tarnik::Http::CreateHttpUserAgent(spec.get(), cookies.get(), nullptr);
  config.tokenFactory = CreateSamlTokenFactory(TrustSigner(sts_.SigningCertificatePem()).get());
  const auto service = CreateSecurityTokenService(config);
  DevSts::Misbehavior setting;
  setting.setCookies = {"host=1; Path=/; Secure", "domain=2; Domain=sts.example; Path=/",
                        "other=3; Domain=other.example; Path=/"};
  sts_.MisbehaveNext(setting);
  Acquire(*service);
  EXPECT_EQ(sts_.LastRequest().HeaderCount("Cookie"), 0U);
  Acquire(*service);
  EXPECT_EQ(sts_.LastRequest().Header("Cookie"), "host=1; domain=2");
  EXPECT_EQ(sts_.LastRequest().Header("Host"), HostField());
}

}  // namespace
}  // namespace SsoClient::Testing
