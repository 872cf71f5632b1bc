#ifndef SSOCLIENT_TESTS_NEGOTIATION_REALM_FIXTURE_H
#define SSOCLIENT_TESTS_NEGOTIATION_REALM_FIXTURE_H

#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <devsts/kerberos_realm.h>
#include <devsts/server.h>
#include <ssoclient/gssapi_negotiation_handler.h>
#include <ssoclient/ssoclient.h>

#include "integration/holder_of_key_fixture.h"
#include "integration/sts_fixture.h"

namespace SsoClient::Testing {

/// The name of the dev STS in the realm.
inline constexpr char kTarget[] = "HTTP@sts.example";

/// Whether the Kerberos library answers a service that signs the list of mechanisms.
inline constexpr bool kSignsMechanisms = SSOCLIENT_KERBEROS_SIGNS_MECHANISMS;

/// A negotiation of two legs, then `more` of them. The second one is the signature of the list of
/// mechanisms if the Kerberos library makes it, and empty otherwise.
DevSts::NegotiationScript TwoLegs(unsigned more = 0);

/// One Kerberos realm for all tests of the process, which belongs to it, and one dev STS with a key
/// of that realm, well-behaved at the start of each test. In the realm, "alice" has a password,
/// "machine" has a keytab, and "nobody" has a password but no account at the STS.
class RealmTest : public testing::Test {
 protected:
  RealmTest();

  static DevSts::KerberosRealm& Realm();
  static DevSts::Server& Sts();
  /// The key of `Sts()`, for another service of the same name.
  static const std::string& ServiceKeytab();

  /// Logs in to `Sts()`.
  static std::shared_ptr<SecurityTokenService> Service();
  static std::shared_ptr<SecurityTokenService> HolderService();
  static std::shared_ptr<InternalApi::GssNegotiationContext> Context();
  /// The configuration of a handler that creates alice's legs.
  static GssapiNegotiationConfig AsAlice();
  static GssapiNegotiationConfig AsMachine();
  static std::shared_ptr<GssapiNegotiationHandler> Alice() {
    return CreateGssapiNegotiationHandler(AsAlice());
  }

  /// Calls `Context()` until it has a token.
  static std::shared_ptr<const SamlToken> LogInByContext(
      InternalApi::GssNegotiationContext& context, NegotiationHandler& handler);

  /// The legs that the STS received since the test began.
  static std::vector<DevSts::ReceivedLeg> Legs();
};

}  // namespace SsoClient::Testing

#endif
