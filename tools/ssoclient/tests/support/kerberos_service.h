#ifndef SSOCLIENT_TOOL_TESTS_SUPPORT_KERBEROS_SERVICE_H
#define SSOCLIENT_TOOL_TESTS_SUPPORT_KERBEROS_SERVICE_H

#include <memory>
#include <string>

#include <devsts/kerberos_realm.h>
#include <devsts/server.h>

namespace SsoClient::Tool::Testing {

/// A Kerberos realm with the user alice and the principal machine, and a dev STS that is its
/// service "HTTP@sts.example".
struct Kerberos {
  /// Throws `std::runtime_error` if the realm cannot be set up.
  Kerberos();

  DevSts::KerberosRealm realm;
  std::string aliceCache;  ///< with tickets
  std::string machineKeytab;
  std::unique_ptr<DevSts::Server> sts;
};

/// One for all tests of the process.
Kerberos& TheKerberos();

}  // namespace SsoClient::Tool::Testing

#endif
