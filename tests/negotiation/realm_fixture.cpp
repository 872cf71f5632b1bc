#include "negotiation/realm_fixture.h"

#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

namespace SsoClient::Testing {

namespace {

/// Adds the process to the realm before any thread reads the environment.
class RealmEnvironment : public testing::Environment {
 public:
  struct Parts {
    Parts() {
      ::setenv("KRB5_CONFIG", realm.ConfigPath().c_str(), 1);
      ::setenv("KRB5CCNAME", "FILE:/nonexistent/cache", 1);
      realm.AddUser("alice", "alice-secret");
      realm.AddUser("nobody", "nobody-secret");
      aliceCache = realm.Login("alice", "alice-secret");
      machineKeytab = realm.AddKeytab("machine");
      serviceKeytab = realm.AddKeytab("HTTP/sts.example");
      DevSts::ServerOptions options;
      options.negotiation.keytab = serviceKeytab;
      sts = std::make_unique<DevSts::Server>(options);
    }

    DevSts::KerberosRealm realm;
    std::string aliceCache;
    std::string machineKeytab;
    std::string serviceKeytab;
    std::unique_ptr<DevSts::Server> sts;
  };

  void SetUp() override { parts = std::make_unique<Parts>(); }
  void TearDown() override { parts.reset(); }

  std::unique_ptr<Parts> parts;
};

RealmEnvironment* const environment = new RealmEnvironment;
const auto* const registered = testing::AddGlobalTestEnvironment(environment);

}  // namespace

DevSts::NegotiationScript TwoLegs(unsigned more) {
  DevSts::NegotiationScript script;
  script.requestMic = kSignsMechanisms;
  script.moreLegs = kSignsMechanisms ? more : more + 1;
  return script;
}

RealmTest::RealmTest() {
  Sts().ClearMisbehavior();
  Sts().SetNegotiationScript({});
  Sts().SetUsers(DevSts::DemoUsers());
  Sts().ClearRequests();
}

DevSts::KerberosRealm& RealmTest::Realm() {
  return environment->parts->realm;
}

DevSts::Server& RealmTest::Sts() {
  return *environment->parts->sts;
}

const std::string& RealmTest::ServiceKeytab() {
  return environment->parts->serviceKeytab;
}

std::shared_ptr<SecurityTokenService> RealmTest::Service() {
  return MakeService(Sts(), Sts().HttpsUrl());
}

std::shared_ptr<SecurityTokenService> RealmTest::HolderService() {
  return MakeHolderService(Sts(), Sts().HttpsUrl(), Holder());
}

std::shared_ptr<InternalApi::GssNegotiationContext> RealmTest::Context() {
  const auto sslContext = TrustCa(Sts());
  const auto resolver = TrustSigner(Sts().SigningCertificatePem());
  SecurityTokenServiceConfig config;
  config.url = Sts().HttpsUrl();
  config.sslContext = sslContext.get();
  config.keyInfoResolver = resolver.get();
  return InternalApi::CreateGssNegotiationContext(config, TenMinutes());
}

GssapiNegotiationConfig RealmTest::AsAlice() {
  GssapiNegotiationConfig config;
  config.targetService = kTarget;
  config.credentialCache = environment->parts->aliceCache;
  return config;
}

GssapiNegotiationConfig RealmTest::AsMachine() {
  GssapiNegotiationConfig config;
  config.targetService = kTarget;
  config.principal = "machine";
  config.keytab = environment->parts->machineKeytab;
  return config;
}

std::shared_ptr<const SamlToken> RealmTest::LogInByContext(
    InternalApi::GssNegotiationContext& context, NegotiationHandler& handler) {
  auto answer = context.Negotiate(*handler.Negotiate({}));
  for (int legs = 1; answer.token == nullptr && legs < 10; ++legs) {
    answer = context.Negotiate(*handler.Negotiate(*answer.outputLeg));
  }
  if (!answer.outputLeg->empty()) {
    handler.Negotiate(*answer.outputLeg);
  }
  return answer.token;
}

std::vector<DevSts::ReceivedLeg> RealmTest::Legs() {
  std::vector<DevSts::ReceivedLeg> legs;
  for (const auto& request : Sts().Requests()) {
    legs.push_back(request.leg.value_or(DevSts::ReceivedLeg{}));
  }
  return legs;
}

}  // namespace SsoClient::Testing
