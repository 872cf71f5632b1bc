#ifndef SSOCLIENT_GSSAPI_TESTS_REALM_FIXTURE_H
#define SSOCLIENT_GSSAPI_TESTS_REALM_FIXTURE_H

#include <devsts/kerberos_realm.h>
#include <gtest/gtest.h>
#include <ssoclient/gssapi_negotiation_handler.h>

#include <memory>
#include <string>

namespace SsoClient::Testing {

/// A realm with the users "alice" and "bob", the service "HTTP/sts.example" and the machine account
/// "machine", of which this process is a part while the tests of a suite run.
class RealmFixture : public testing::Test {
 protected:
  static constexpr char kService[] = "HTTP@sts.example";

  static void SetUpTestSuite();
  static void TearDownTestSuite();

  /// Without a default credential cache.
  RealmFixture();

  /// A configuration with a new ticket of the user's.
  static GssapiNegotiationConfig ConfigOf(const std::string& user);
  /// A configuration with the keys of "machine".
  static GssapiNegotiationConfig MachineConfig();
  /// Stops the realm's KDC and has this process look for it at a port of 127.0.0.1, by TCP, until
  /// the realm's clock is set.
  static void ReplaceKdc(int port);
  /// No thread may run meanwhile.
  static void SetDefaultCache(const std::string& name);

  static std::unique_ptr<DevSts::KerberosRealm> realm;
  static std::string serviceKeytab;
  static std::string machineKeytab;
};

}  // namespace SsoClient::Testing

#endif
