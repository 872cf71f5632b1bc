#include <chrono>
#include <exception>
#include <functional>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <ssoclient/security_token_service.h>

#include "doctor/login_findings.h"
#include "doctor/login_parts.h"
#include "doctor/steps.h"
#include "service/service_call.h"

namespace SsoClient::Tool::Doctor {
namespace {

// Long enough for a token that is only looked at.
constexpr std::int64_t kLifetimeSec = 300;

TokenSpec MakeSpec() {
  TokenSpec spec;
  spec.tokenLifetimeSec = kLifetimeSec;
  return spec;
}

std::shared_ptr<SamlTokenFactory> MakeFactory(const Examination& examination) {
  if (examination.signers.empty()) {
    return CreateSamlTokenFactory(nullptr);
  }
  const auto resolver =
      Tarnik::Xml::Security::CreateTrustedCertificatesResolver(examination.signers);
  return CreateSamlTokenFactory(resolver.get());
}

std::string SubjectsOf(const Examination& examination) {
  std::string subjects;
  for (const auto& signer : examination.signers) {
    subjects += (subjects.empty() ? "" : "; ") + signer->SubjectName() + " (SHA-256 " +
                Tarnik::Crypto::FingerprintText(*signer) + ")";
  }
  return subjects;
}

using Token = std::shared_ptr<const SamlToken>;
using Operation = std::function<Token(const SecurityTokenService&)>;

// How an operation has ended. The exception has its own class, unlike that of RunCall.
struct Ending {
  Token token{};
  std::exception_ptr failure{};
};

// One login of the kind that was asked for. What it uses is shared with the thread of the call,
// which may be abandoned.
class Login {
 public:
  explicit Login(Examination& examination)
      : examination_(examination),
        factory_(std::make_shared<KeepingFactory>(MakeFactory(examination))),
        password_(std::make_shared<SecretText>()) {}

  Token Run() {
    const Operation operation = MakeOperation();
    const Ending ending = RunCall<Ending>(examination_.console, MakeSetup(),
                                          [operation](const SecurityTokenService& service) {
                                            Ending result;
                                            try {
                                              result.token = operation(service);
                                            } catch (...) {
                                              result.failure = std::current_exception();
                                            }
                                            return result;
                                          });
    if (ending.failure) {
      std::rethrow_exception(ending.failure);
    }
    return ending.token;
  }

  bool HasKerberosFailed() const { return handler_ && handler_->HasFailed(); }
  const std::string& Password() const { return password_->Text(); }
  std::vector<ClaimedSigner> Signers() const {
    // The text may still change in an abandoned call.
    return IsCallAbandoned() ? std::vector<ClaimedSigner>()
                             : ReadClaimedSigners(factory_->Text(), Password());
  }

 private:
  ServiceSetup MakeSetup() const {
    ServiceSetup setup;
    setup.address = examination_.service;
    setup.peerName = examination_.plan.peerName;
    setup.sslContext = examination_.sslContext;
    setup.tokenFactory = factory_;
    if (examination_.identity) {
      setup.holderOfKey = *examination_.identity;
    }
    setup.secret = Password();
    const auto time = examination_.limit.ForStep() - TimeLimit::Clock::now();
    setup.timeoutSec = std::chrono::duration<double>(time).count();
    return setup;
  }

  Operation MakeOperation() {
    switch (examination_.plan.login) {
      case LoginKind::kPassword:
        return ByPassword();
      case LoginKind::kCertificate:
        return [](const SecurityTokenService& service) {
          return service.AcquireTokenByCertificate(MakeSpec());
        };
      default:
        return ByKerberos();
    }
  }

  Operation ByPassword() {
    const auto begin = TimeLimit::Clock::now();
    *password_ = examination_.plan.readPassword();
    examination_.limit.Extend(TimeLimit::Clock::now() - begin);
    return
        [user = examination_.plan.user, password = password_](const SecurityTokenService& service) {
          return service.AcquireToken(user, password->Text(), MakeSpec());
        };
  }

  Operation ByKerberos() {
    handler_ = std::make_shared<NotingHandler>(
        examination_.plan.makeKerberosHandler(examination_.service.host));
    return [handler = handler_](const SecurityTokenService& service) {
      return service.AcquireTokenByGSS(MakeSpec(), *handler);
    };
  }

  Examination& examination_;
  std::shared_ptr<KeepingFactory> factory_;
  std::shared_ptr<NotingHandler> handler_;
  std::shared_ptr<SecretText> password_;
};

Finding FindingOfSuccess(const Examination& examination,
                         const std::vector<ClaimedSigner>& signers) {
  if (!examination.signers.empty()) {
    return Fine("the service has issued a token, and its signature is verified");
  }
  const std::string signer =
      signers.empty() ? "a key without a certificate"
                      : signers.front().subject + " (SHA-256 " + signers.front().fingerprint + ")";
  return Warning(ExitStatus::kUnreachable, "signature-not-verified",
                 "the service has issued a token, which says that it is signed with " + signer,
                 "give the signing certificate of the service as --sts-certificate");
}

}  // namespace

Step ExamineLogin(Examination& examination) {
  Step step;
  if (examination.plan.login == LoginKind::kNone) {
    step.finding = NotNeeded("no login was asked for: --user, --certificate or --kerberos");
    return step;
  }
  if (!examination.service.isHttps && !examination.plan.isHttpAllowed) {
    step.finding = Failure(
        ExitStatus::kUsage, "plain-http",
        "over http, anyone on the network path can read passwords and tokens: no login was sent",
        "use an https URL, or accept this with --allow-http");
    return step;
  }
  Login login(examination);
  std::vector<ClaimedSigner> signers;
  try {
    examination.token = login.Run();
    signers = login.Signers();
  } catch (const std::exception& failure) {
    signers = login.Signers();
    step.finding = FindingOfLoginFailure(failure, {.signers = signers,
                                                   .trusted = SubjectsOf(examination),
                                                   .secret = login.Password(),
                                                   .isKerberos = login.HasKerberosFailed()});
  }
  for (const ClaimedSigner& signer : signers) {
    step.details["claimedSigners"].push_back(
        {{"subject", signer.subject}, {"fingerprint", signer.fingerprint}});
  }
  if (examination.token) {
    step.finding = FindingOfSuccess(examination, signers);
  }
  return step;
}

}  // namespace SsoClient::Tool::Doctor
