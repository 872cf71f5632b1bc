#include "support/kerberos_service.h"

#include <stdlib.h>

namespace SsoClient::Tool::Testing {

Kerberos::Kerberos() {
  // Read by the dev STS, in this process, when it begins to accept tickets.
  setenv("KRB5_CONFIG", realm.ConfigPath().c_str(), 1);
  realm.AddUser("alice", "alice-secret");
  aliceCache = realm.Login("alice", "alice-secret");
  machineKeytab = realm.AddKeytab("machine");
  DevSts::ServerOptions options;
  options.negotiation.keytab = realm.AddKeytab("HTTP/sts.example");
  sts = std::make_unique<DevSts::Server>(options);
}

Kerberos& TheKerberos() {
  static Kerberos kerberos;
  return kerberos;
}

}  // namespace SsoClient::Tool::Testing
