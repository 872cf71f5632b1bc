#include "support/kerberos_service.h"

#include <stdlib.h>

namespace SsoClient::Tool::Testing {

KerberosService& KerberosService::Shared() {
  static KerberosService service;
  return service;
}

KerberosService::KerberosService() {
  // Read by the dev STS, in this process, when it begins to accept tickets.
  setenv("KRB5_CONFIG", realm_.ConfigPath().c_str(), 1);
  realm_.AddUser("alice", "alice-secret");
  aliceCache_ = realm_.Login("alice", "alice-secret");
  machineKeytab_ = realm_.AddKeytab("machine");
  DevSts::ServerOptions options;
  options.negotiation.keytab = realm_.AddKeytab("HTTP/sts.example");
  sts_ = std::make_unique<DevSts::Server>(options);
}

std::map<std::string, std::optional<std::string>> KerberosService::Environment() const {
  return {{"KRB5_CONFIG", realm_.ConfigPath()}, {"KRB5CCNAME", "FILE:/nonexistent/cache"}};
}

}  // namespace SsoClient::Tool::Testing
