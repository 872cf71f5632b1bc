#ifndef SSOCLIENT_TOOL_TESTS_SUPPORT_KERBEROS_SERVICE_H
#define SSOCLIENT_TOOL_TESTS_SUPPORT_KERBEROS_SERVICE_H

#include <map>
#include <memory>
#include <optional>
#include <string>

#include <devsts/kerberos_realm.h>
#include <devsts/server.h>

namespace SsoClient::Tool::Testing {

/// A Kerberos realm with the user alice and the principal machine, and a dev STS that is the
/// service `kService` of it. One for all tests of the process.
class KerberosService {
 public:
  static constexpr const char* kService = "HTTP@sts.example";

  /// Throws `std::runtime_error` if the realm cannot be set up.
  static KerberosService& Shared();

  DevSts::Server& Sts() { return *sts_; }
  /// The cache with the tickets of alice.
  const std::string& AliceCache() const { return aliceCache_; }
  const std::string& MachineKeytab() const { return machineKeytab_; }
  /// Variables of a process that is part of the realm and has no tickets.
  std::map<std::string, std::optional<std::string>> Environment() const;

 private:
  KerberosService();

  DevSts::KerberosRealm realm_;
  std::string aliceCache_;
  std::string machineKeytab_;
  std::unique_ptr<DevSts::Server> sts_;
};

}  // namespace SsoClient::Tool::Testing

#endif
