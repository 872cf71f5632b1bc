#include <chrono>
#include <cstddef>
#include <cstring>
#include <iostream>
#include <string>

#include <ssoclient/access/call_context.h>
#include <ssoclient/access/failure_kind.h>
#include <ssoclient/access/token_gate.h>
#include <ssoclient/access/token_source.h>
#include <ssoclient/access/version.h>
#include <ssoclient/ssoclient.h>

namespace {

using SsoClient::Access::FailureKind;

bool HasTheVersionOfItsPackage() {
  return std::strcmp(SSOCLIENT_ACCESS_VERSION, PACKAGE_VERSION) == 0 &&
         std::strcmp(SsoClient::Access::Version(), PACKAGE_VERSION) == 0;
}

bool ClassifiesRefusedLogins() {
  const FailureKind kind =
      SsoClient::Access::Classify(SsoClient::InvalidCredentialsException("refused"));
  return kind == FailureKind::kRefusedLogin &&
         SsoClient::Access::NameOf(kind) == std::string("refused-login") &&
         !SsoClient::Access::AllowsFailover(kind);
}

bool ReportsCancellation() {
  const SsoClient::Access::CancellationSource source;
  bool hasRun = false;
  const auto registration = source.Token().OnCancel([&hasRun] { hasRun = true; });
  source.Cancel();
  return hasRun;
}

SsoClient::Access::TokenSourceConfig UnreachableSource() {
  SsoClient::Access::TokenSourceConfig config;
  config.endpoints = {{"http://127.0.0.1:1/sts", ""}};
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(nullptr);
  config.login = SsoClient::Access::PasswordLogin{"user", [] { return std::string("password"); }};
  config.retry.attempts = 1;
  config.listener = SsoClient::Access::CreateLogListener();
  return config;
}

bool ReportsAnUnreachableEndpoint() {
  const auto source = SsoClient::Access::CreateTokenSource(UnreachableSource());
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 60;
  try {
    source->GetToken(spec, SsoClient::Access::CallContext::Within(std::chrono::seconds(20)));
  } catch (const SsoClient::CommunicationException&) {
    const auto kind = static_cast<std::size_t>(FailureKind::kUnreachable);
    return source->Metrics().attempts.at(kind) == 1;
  }
  return false;
}

bool RefusesASourceWithoutEndpoints() {
  try {
    SsoClient::Access::CreateTokenSource({});
  } catch (const Tarnik::InvalidArgumentException& e) {
    return std::string(e.what()) == "There is no endpoint.";
  }
  return false;
}

using SsoClient::Access::Verdict;

/// A gate of the program's own, as its tests may have one.
class ClosedGate final : public SsoClient::Access::TokenGate {
 public:
  Verdict Check(const std::string& /*token*/,
                const SsoClient::Access::Presenter& /*presenter*/) const override {
    return Verdict::Refuse(SsoClient::Access::Reason::kExpired, "It is late.");
  }
  SsoClient::Access::GateMetrics Metrics() const override { return {}; }
};

bool ImplementsAGate() {
  const ClosedGate closed;
  const SsoClient::Access::TokenGate& gate = closed;
  const Verdict verdict = gate.Check("", SsoClient::Access::Presenter::Nobody());
  return !verdict.IsAccepted() && verdict.Token() == nullptr && gate.Metrics().accepted == 0 &&
         RemedyOf(verdict.Refusal()) == SsoClient::Access::Remedy::kNewToken &&
         verdict.ToString().rfind("refused (expired): It is late.\n", 0) == 0;
}

bool RefusesAGateWithoutTrust() {
  try {
    SsoClient::Access::CreateTokenGate({});
  } catch (const Tarnik::InvalidArgumentException& e) {
    return std::string(e.what()) == "The trust store of the gate (trust) is null.";
  }
  return false;
}

bool RefusesATrustStoreWithoutFiles() {
  SsoClient::Access::TrustStoreConfig config;
  config.issuers.resize(1);
  config.issuers[0].issuer = "https://sts.example.com/STS";
  config.issuers[0].certificatePaths = {"/nonexistent/sts.pem"};
  config.listener = SsoClient::Access::CreateTrustLogListener();
  try {
    SsoClient::Access::CreateTrustStore(config);
  } catch (const Tarnik::IOException& e) {
    return std::string(e.what()).find("/nonexistent/sts.pem") != std::string::npos;
  }
  return false;
}

}  // namespace

int main() {
  if (!HasTheVersionOfItsPackage()) {
    std::cerr << "The package has the version " << PACKAGE_VERSION << ", its library "
              << SsoClient::Access::Version() << ".\n";
    return 1;
  }
  if (!ClassifiesRefusedLogins() || !ReportsCancellation() || !ReportsAnUnreachableEndpoint() ||
      !RefusesASourceWithoutEndpoints()) {
    std::cerr << "The installed library of token sources does not work as expected.\n";
    return 1;
  }
  if (!ImplementsAGate() || !RefusesAGateWithoutTrust() || !RefusesATrustStoreWithoutFiles()) {
    std::cerr << "The installed library of token gates does not work as expected.\n";
    return 1;
  }
  std::cout << "The installed library of token sources works.\n";
  return 0;
}
