#include "negotiation_fixture.h"

#include <cstdlib>

namespace DevSts::Testing {

std::unique_ptr<KerberosRealm> NegotiationFixture::realm;
std::string NegotiationFixture::keytab;
std::string NegotiationFixture::alice;
std::string NegotiationFixture::bob;
std::string NegotiationFixture::carol;

void NegotiationFixture::SetUpTestSuite() {
  realm = std::make_unique<KerberosRealm>();
  setenv("KRB5_CONFIG", realm->ConfigPath().c_str(), 1);
  keytab = realm->AddKeytab(kService);
  for (const char* name : {"alice", "bob", "carol"}) {
    realm->AddUser(name, "secret");
  }
  alice = realm->Login("alice", "secret");
  bob = realm->Login("bob", "secret");
  carol = realm->Login("carol", "secret");
}

void NegotiationFixture::TearDownTestSuite() {
  unsetenv("KRB5_CONFIG");
  realm.reset();
}

ServerOptions NegotiationFixture::Options() {
  ServerOptions options;
  options.negotiation.keytab = keytab;
  return options;
}

}  // namespace DevSts::Testing
