#ifndef SSOCLIENT_GSSAPI_TESTS_REALM_FIXTURE_H
#define SSOCLIENT_GSSAPI_TESTS_REALM_FIXTURE_H

#include <memory>
#include <string>

#include <gtest/gtest.h>

#include <devsts/kerberos_realm.h>
#include <ssoclient/gssapi_negotiation_handler.h>

namespace SsoClient::Testing {

/// A realm with the users "alice" and "bob", the service "HTTP/sts.example" and the machine account
/// "machine". This process is part of it while the tests of a suite run.
class RealmFixture : public testing::Test {
 protected:
  static constexpr char kService[] = "HTTP@sts.example";

  static void SetUpTestSuite();
  static void TearDownTestSuite();

  /// Sets the default credential cache to one that does not exist.
  RealmFixture();

  /// A configuration with a new ticket for the user.
  static GssapiNegotiationConfig ConfigOf(const std::string& user);
  /// A configuration with the keys of "machine".
  static GssapiNegotiationConfig MachineConfig();
  /// Stops the realm's KDC and makes this process connect to a port of 127.0.0.1 instead, by TCP,
  /// until the realm's clock is set.
  static void ReplaceKdc(int port);
  /// Must not be called while other threads run.
  static void SetDefaultCache(const std::string& name);

  static std::unique_ptr<DevSts::KerberosRealm> realm;
  static std::string serviceKeytab;
  static std::string machineKeytab;
};

}  // namespace SsoClient::Testing

#endif
