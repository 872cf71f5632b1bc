// If Kerberos refuses a login, the exception has the message of Kerberos, and nothing is sent.
#include <chrono>
#include <string>

#include <gmock/gmock.h>

#include "negotiation/realm_fixture.h"

namespace SsoClient::Testing {
namespace {

using testing::HasSubstr;
using testing::IsEmpty;
using namespace std::chrono_literals;

class KerberosErrorsTest : public RealmTest {
 protected:
  static std::string Failure(const GssapiNegotiationConfig& config) {
    const auto handler = CreateGssapiNegotiationHandler(config);
    const std::string message =
        MessageOf<SsoException>([&] { Service()->AcquireTokenByGSS(TenMinutes(), *handler); });
    EXPECT_THAT(Sts().Requests(), IsEmpty());
    return message;
  }
};

TEST_F(KerberosErrorsTest, NoTickets) {
  auto config = AsAlice();
  config.credentialCache.clear();
  EXPECT_THAT(Failure(config), HasSubstr("No Kerberos credentials available"));
}

TEST_F(KerberosErrorsTest, UnknownService) {
  auto config = AsAlice();
  config.targetService = "HTTP@unknown.example";
  EXPECT_THAT(Failure(config), HasSubstr("not found in Kerberos database"));
}

// Restores the KDC, which each test stops or runs with a wrong clock.
class BrokenRealmTest : public KerberosErrorsTest {
 protected:
  ~BrokenRealmTest() override { Realm().SetClock(0s); }
};

TEST_F(BrokenRealmTest, ExpiredTicket) {
  auto config = AsAlice();
  Realm().SetClock(-1h);
  config.credentialCache = Realm().Login("alice", "alice-secret", 10min);
  EXPECT_THAT(Failure(config), HasSubstr("expired"));
}

TEST_F(BrokenRealmTest, ClockTooFarOff) {
  auto config = AsAlice();
  config.credentialCache = Realm().Login("alice", "alice-secret", 8h);
  Realm().SetClock(2h);
  EXPECT_THAT(Failure(config), HasSubstr("Clock skew too great"));
}

TEST_F(BrokenRealmTest, RealmThatDoesNotAnswer) {
  auto config = AsAlice();
  config.credentialCache = Realm().Login("alice", "alice-secret");
  Realm().StopKdc();
  EXPECT_THAT(Failure(config), HasSubstr("Cannot contact any KDC for realm 'EXAMPLE.COM'"));
}

}  // namespace
}  // namespace SsoClient::Testing
