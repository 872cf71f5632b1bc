#include <chrono>
#include <exception>
#include <utility>

#include <ssoclient/security_token_service.h>
#include <tarnik/http/bounded_user_agent.h>
#include <tarnik/http/cookie_store.h>

#ifdef SSOCLIENT_TOOL_HAS_GSSAPI
#include <ssoclient/gssapi_negotiation_handler.h>
#endif

#include "doctor/library_connection.h"
#include "doctor/login_findings.h"
#include "doctor/login_parts.h"
#include "doctor/steps.h"

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

// One login of the kind that was asked for.
class Login {
 public:
  explicit Login(Examination& examination)
      : examination_(examination),
        factory_(std::make_shared<KeepingFactory>(MakeFactory(examination))) {}

  std::shared_ptr<const SamlToken> Run() {
    const Plan& plan = examination_.plan;
    switch (plan.login) {
      case LoginKind::kPassword:
        return ByPassword();
      case LoginKind::kCertificate:
        return Service()->AcquireTokenByCertificate(MakeSpec());
      default:
        return ByKerberos();
    }
  }

  bool HasKerberosFailed() const { return handler_ && handler_->HasFailed(); }
  const std::string& Password() const { return password_.Text(); }
  const std::string& TokenText() const { return factory_->Text(); }

 private:
  std::shared_ptr<SecurityTokenService> Service() {
    const auto spec = MakeConnectionSpec(examination_);
    const auto cookies = Tarnik::Http::CreateCookieStore("doctor");
    const auto agent = Tarnik::Http::CreateHttpUserAgent(spec.get(), cookies.get(), nullptr);
    const auto limit = Tarnik::Http::CreateCallLimit(examination_.limit.ForStep());
    SecurityTokenServiceConfigEx config;
    config.url = examination_.target.path;
    config.userAgent = Tarnik::Http::CreateBoundedUserAgent(agent.get(), limit.get());
    config.tokenFactory = factory_;
    if (examination_.identity) {
      config.holderOfKeyConfig = *examination_.identity;
    }
    return CreateSecurityTokenService(config);
  }

  std::shared_ptr<const SamlToken> ByPassword() {
    const auto begin = TimeLimit::Clock::now();
    password_ = examination_.plan.readPassword();
    examination_.limit.Extend(TimeLimit::Clock::now() - begin);
    return Service()->AcquireToken(examination_.plan.user, password_.Text(), MakeSpec());
  }

  std::shared_ptr<const SamlToken> ByKerberos() {
#ifdef SSOCLIENT_TOOL_HAS_GSSAPI
    const Plan& plan = examination_.plan;
    GssapiNegotiationConfig kerberos;
    kerberos.targetService =
        plan.kerberosService.empty() ? "HTTP@" + examination_.target.host : plan.kerberosService;
    kerberos.principal = plan.principal;
    kerberos.keytab = plan.keytab;
    handler_ = std::make_shared<NotingHandler>(CreateGssapiNegotiationHandler(kerberos));
    return Service()->AcquireTokenByGSS(MakeSpec(), *handler_);
#else
    throw SsoException("this build of the program has no Kerberos");
#endif
  }

  Examination& examination_;
  std::shared_ptr<KeepingFactory> factory_;
  std::shared_ptr<NotingHandler> handler_;
  SecretText password_;
};

Finding JudgeSuccess(const Examination& examination, const std::vector<ClaimedSigner>& signers) {
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
  Login login(examination);
  std::vector<ClaimedSigner> signers;
  try {
    examination.token = login.Run();
    signers = ReadClaimedSigners(login.TokenText(), login.Password());
  } catch (const std::exception& failure) {
    signers = ReadClaimedSigners(login.TokenText(), login.Password());
    step.finding = JudgeLoginFailure(failure, {.signers = signers,
                                               .trusted = SubjectsOf(examination),
                                               .secret = login.Password(),
                                               .isKerberos = login.HasKerberosFailed()});
  }
  for (const ClaimedSigner& signer : signers) {
    step.details["claimedSigners"].push_back(
        {{"subject", signer.subject}, {"fingerprint", signer.fingerprint}});
  }
  if (examination.token) {
    step.finding = JudgeSuccess(examination, signers);
  }
  return step;
}

}  // namespace SsoClient::Tool::Doctor
