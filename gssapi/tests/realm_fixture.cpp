#include "realm_fixture.h"

#include <cstdlib>
#include <fstream>

namespace SsoClient::Testing {

std::unique_ptr<DevSts::KerberosRealm> RealmFixture::realm;
std::string RealmFixture::serviceKeytab;
std::string RealmFixture::machineKeytab;

void RealmFixture::SetUpTestSuite() {
  realm = std::make_unique<DevSts::KerberosRealm>();
  realm->AddUser("alice", "secret");
  realm->AddUser("bob", "secret");
  serviceKeytab = realm->AddKeytab("HTTP/sts.example");
  machineKeytab = realm->AddKeytab("machine");
  ::setenv("KRB5_CONFIG", realm->ConfigPath().c_str(), 1);
}

void RealmFixture::TearDownTestSuite() {
  ::unsetenv("KRB5_CONFIG");
  ::unsetenv("KRB5CCNAME");
  realm.reset();
}

RealmFixture::RealmFixture() {
  SetDefaultCache("FILE:/nonexistent/cache");
}

GssapiNegotiationConfig RealmFixture::ConfigOf(const std::string& user) {
  GssapiNegotiationConfig config;
  config.targetService = kService;
  config.credentialCache = realm->Login(user, "secret");
  return config;
}

GssapiNegotiationConfig RealmFixture::MachineConfig() {
  GssapiNegotiationConfig config;
  config.targetService = kService;
  config.principal = "machine";
  config.keytab = machineKeytab;
  return config;
}

void RealmFixture::ReplaceKdc(int port) {
  realm->StopKdc();
  std::ofstream(realm->ConfigPath())
      << "[libdefaults]\n default_realm = EXAMPLE.COM\n dns_canonicalize_hostname = false\n"
         " udp_preference_limit = 1\n[realms]\n EXAMPLE.COM = {\n  kdc = 127.0.0.1:"
      << port << "\n }\n";
}

void RealmFixture::SetDefaultCache(const std::string& name) {
  ::setenv("KRB5CCNAME", name.c_str(), 1);
}

}  // namespace SsoClient::Testing
