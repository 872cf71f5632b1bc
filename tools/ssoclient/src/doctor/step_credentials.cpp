#include <tarnik/core/exception.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>

#include "doctor/local_files.h"
#include "doctor/steps.h"

namespace SsoClient::Tool::Doctor {
namespace {

using Tarnik::Crypto::Certificate;
using Tarnik::Crypto::PrivateKey;

Tarnik::Ref<const PrivateKey> LoadKey(Examination& examination) {
  const Plan& plan = examination.plan;
  return Tarnik::Crypto::LoadPrivateKey(plan.keyFile, [&] {
    const auto begin = TimeLimit::Clock::now();
    const SecretText passphrase = plan.readPassphrase();
    examination.limit.Extend(TimeLimit::Clock::now() - begin);
    return passphrase.Text();
  });
}

Finding BadFile(const char* name, const std::string& path, const std::exception& reason,
                const char* remedy) {
  return Failure(ExitStatus::kLocal, name, "'" + path + "': " + reason.what(), remedy);
}

void Load(Examination& examination, Step& step) {
  const Plan& plan = examination.plan;
  HolderOfKeyConfig identity;
  try {
    identity.certificate = Tarnik::Crypto::LoadPemOrDerCertificates(plan.certificateFile).front();
  } catch (const Tarnik::Exception& reason) {
    step.finding = BadFile("bad-certificate-file", plan.certificateFile, reason,
                           "give the certificate of the login as PEM or DER");
    return;
  }
  try {
    identity.privateKey = LoadKey(examination);
  } catch (const Tarnik::Exception& reason) {
    step.finding = BadFile("bad-key-file", plan.keyFile, reason,
                           "give the private key as PEM, and its passphrase if it has one");
    return;
  }
  if (!identity.privateKey->Matches(*identity.certificate)) {
    step.finding = Failure(ExitStatus::kLocal, "key-mismatch",
                           "the key of '" + plan.keyFile + "' does not belong to " +
                               identity.certificate->SubjectName(),
                           "give the key that the certificate was issued for");
    return;
  }
  examination.identity = identity;
  step.details = {{"subject", identity.certificate->SubjectName()},
                  {"notBefore", identity.certificate->NotBefore().ToString()},
                  {"notAfter", identity.certificate->NotAfter().ToString()},
                  {"fingerprint", Tarnik::Crypto::FingerprintText(*identity.certificate)}};
  step.lines.push_back("certificate: " + identity.certificate->SubjectName() + ", valid until " +
                       identity.certificate->NotAfter().ToString());
}

Step ExamineIdentity(Examination& examination) {
  Step step;
  const Plan& plan = examination.plan;
  for (const std::string& path : {plan.certificateFile, plan.keyFile}) {
    if (const auto problem = FileProblem(path)) {
      step.finding = *problem;
      return step;
    }
  }
  Load(examination, step);
  if (step.finding.outcome == StepOutcome::kFailed) {
    return step;
  }
  const auto validity =
      ValidityProblem("the certificate of the login", *examination.identity->certificate,
                      Tarnik::System::GetUtcDateTime());
  const auto permission = PermissionProblem(plan.keyFile);
  step.finding = validity     ? *validity
                 : permission ? *permission
                              : Fine("the key belongs to the certificate");
  return step;
}

Step ExamineKeytab(const Plan& plan) {
  Step step;
  if (const auto problem = FileProblem(plan.keytab)) {
    step.finding = *problem;
  } else if (const auto permission = PermissionProblem(plan.keytab)) {
    step.finding = *permission;
  } else {
    step.finding = Fine("the keytab can be read");
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
      // Other forms than a path are names that only the Kerberos library can resolve.
      if (!plan.keytab.empty() && plan.keytab.find(':') == std::string::npos) {
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
