#include "chaos/peer.h"

#include <algorithm>

#include <tarnik/http/connection_specs.h>

#include "integration/holder_of_key_fixture.h"
#include "support/holder_of_key.h"

namespace SsoClient::Testing {
namespace {

constexpr std::size_t kUsesOfAToken = 1000;

DevSts::ServerOptions Options() {
  DevSts::ServerOptions options;
  options.requestLogLimit = 1;
  return options;
}

}  // namespace

Peer::Peer() : sts_(Options()) {
  sts_.RegisterCertificate(kMachine, Holder().certificatePem);
  plain_ = MakeHolderService(sts_, sts_.HttpUrl(), Holder());
  tls_ = MakeHolderService(sts_, sts_.HttpsUrl(), Holder());
  named_ = MakeHolderService(sts_, sts_.HttpsUrlFor("localhost"), Holder());
}

std::shared_ptr<SecurityTokenService> Peer::ServiceWithin(Tarnik::Http::CallLimit& limit,
                                                          bool hasTls, int port) const {
  const auto spec =
      hasTls ? Tarnik::Http::CreateTLSConnectionSpec("127.0.0.1", port, TrustCa(sts_).get(), "")
             : Tarnik::Http::CreateTCPConnectionSpec("127.0.0.1", port);
  const auto agent = Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  SecurityTokenServiceConfigEx config;
  config.url = "/sts";
  config.userAgent = Tarnik::Http::CreateBoundedUserAgent(agent.get(), &limit);
  config.tokenFactory = CreateSamlTokenFactory(TrustSigner(sts_.SigningCertificatePem()).get());
  config.holderOfKeyConfig = ConfigOf(Holder());
  return CreateSecurityTokenService(config);
}

const Testing::Arguments& Peer::Arguments() {
  if (uses_++ % kUsesOfAToken == 0) {
    sts_.ClearMisbehavior();
    arguments_.spec = RenewableAndDelegable();
    arguments_.token = plain_->AcquireToken(kUser, kPassword, arguments_.spec);
  }
  return arguments_;
}

void Peer::WarmUp(const Run& run) {
  for (const Operation operation : kOperations) {
    for (const bool hasTls : {false, true}) {
      RequireSuccess(run, operation, CallNow(operation, Service(hasTls), Arguments()));
      RequireSuccess(run, operation, CallAsync(operation, Service(hasTls), Arguments()).get());
    }
  }
  AwaitIdle(run);
}

void Peer::AwaitIdle(const Run& run) const {
  run.Require(sts_.WaitUntil([](const auto& counters) { return counters.connectionsOpen == 0; }),
              "a connection to the STS stays open");
}

std::string CallName(Operation operation, bool hasTls) {
  return NameOf(operation) + std::string(hasTls ? " over TLS" : " over TCP");
}

void RequireSuccess(const Run& run, Operation operation, const Outcome& outcome) {
  run.Require(outcome.IsSuccess(),
              std::string("the call failed: ") + outcome.errorClass.name() + " " + outcome.message);
  if (operation == Operation::Validate) {
    run.Require(outcome.verdict == true, "the token is not valid");
    return;
  }
  const std::string subject = operation == Operation::Certificate ? "machine" : "alice";
  run.Require(outcome.token != nullptr && outcome.token->Subject().name == subject,
              "the call returned another token");
}

void RequireFailure(const Run& run, const Outcome& outcome,
                    std::initializer_list<std::type_index> classes) {
  run.Require(!outcome.IsSuccess(), "the call succeeded");
  run.Require(outcome.token == nullptr && !outcome.verdict, "a failure has a result");
  run.Require(std::find(classes.begin(), classes.end(), outcome.errorClass) != classes.end(),
              std::string("the class is ") + outcome.errorClass.name() + ": " + outcome.message);
}

}  // namespace SsoClient::Testing
