#include <optional>
#include <string>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/certificate.h>

#include "doctor/local_files.h"
#include "doctor/steps.h"
#include "failure.h"

namespace SsoClient::Tool::Doctor {
namespace {

using Tarnik::Crypto::Certificate;

// Whether the certificate can be read, if it has a file of its own.
std::optional<Finding> CertificateProblem(const Plan& plan) {
  if (plan.keyFile == plan.certificateFile) {
    return std::nullopt;
  }
  try {
    Tarnik::Crypto::LoadPemOrDerCertificates(plan.certificateFile);
    return std::nullopt;
  } catch (const Tarnik::Exception& reason) {
    return Failure(ExitStatus::kLocal, "bad-certificate-file",
                   "'" + plan.certificateFile + "': " + reason.what(),
                   "give the certificate of the login as PEM or DER");
  }
}

// Asking for a passphrase takes no time of the examination.
HolderOfKeyConfig Load(Examination& examination) {
  const auto begin = TimeLimit::Clock::now();
  HolderOfKeyConfig identity = examination.plan.loadIdentity();
  examination.limit.Extend(TimeLimit::Clock::now() - begin);
  return identity;
}

Finding KeyProblem(const Tool::Failure& failure) {
  return Failure(
      failure.status, FindingName::FindOr(failure.kind, "bad-key-file"), failure.message,
      failure.remedy.empty() ? "give the key that the certificate was issued for" : failure.remedy);
}

void Show(Step& step, const Certificate& certificate) {
  step.details = {{"subject", certificate.SubjectName()},
                  {"notBefore", certificate.NotBefore().ToString()},
                  {"notAfter", certificate.NotAfter().ToString()},
                  {"fingerprint", Tarnik::Crypto::FingerprintText(certificate)}};
  step.lines.push_back("certificate: " + certificate.SubjectName() + ", valid until " +
                       certificate.NotAfter().ToString());
}

std::optional<Finding> FilesProblem(const Plan& plan) {
  for (const std::string& path : {plan.certificateFile, plan.keyFile}) {
    std::optional<Finding> problem = path.empty() ? std::nullopt : FileProblem(path);
    if (problem) {
      return problem;
    }
  }
  return CertificateProblem(plan);
}

Step ExamineIdentity(Examination& examination) {
  Step step;
  const Plan& plan = examination.plan;
  if (const auto problem = FilesProblem(plan)) {
    step.finding = *problem;
    return step;
  }
  try {
    examination.identity = Load(examination);
  } catch (const ToolException& exception) {
    step.finding = KeyProblem(exception.GetFailure());
    return step;
  }
  const Certificate& certificate = *examination.identity->certificate;
  Show(step, certificate);
  const auto validity = ValidityProblem("the certificate of the login", certificate,
                                        Tarnik::System::GetUtcDateTime(), "have it renewed");
  step.finding = validity ? *validity : Fine("the key belongs to the certificate");
  return step;
}

Step ExamineKeytab(const Plan& plan) {
  Step step;
  if (const auto problem = FileProblem(plan.keytabFile)) {
    step.finding = *problem;
    return step;
  }
  try {
    plan.checkKeytab();
    step.finding = Fine("the keytab can be read");
  } catch (const ToolException& exception) {
    const Tool::Failure& failure = exception.GetFailure();
    step.finding = Failure(failure.status, FindingName::FindOr(failure.kind, "file-unreadable"),
                           failure.message,
                           failure.remedy.empty() ? "check the file of --keytab" : failure.remedy);
  }
  return step;
}

}  // namespace

Step ExamineCredentials(Examination& examination) {
  Step step;
  const Plan& plan = examination.plan;
  switch (plan.login) {
    case LoginKind::kCertificate:
      return ExamineIdentity(examination);
    case LoginKind::kKerberos:
      if (!plan.keytabFile.empty()) {
        return ExamineKeytab(plan);
      }
      step.finding = NotNeeded("the Kerberos library finds the tickets when it logs in");
      return step;
    case LoginKind::kPassword:
      step.finding = NotNeeded("the password is read when it is needed");
      return step;
    case LoginKind::kNone:
      break;
  }
  step.finding = NotNeeded("no login was asked for");
  return step;
}

}  // namespace SsoClient::Tool::Doctor
