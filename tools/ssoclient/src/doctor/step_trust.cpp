#include <exception>
#include <vector>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/revocation_list.h>

#include "doctor/local_files.h"
#include "doctor/steps.h"
#include "output/count_text.h"

namespace SsoClient::Tool::Doctor {
namespace {

using Certificates = std::vector<Tarnik::Ref<const Tarnik::Crypto::Certificate>>;

void Show(Step& step, const std::string& what, const Certificates& certificates) {
  for (const auto& certificate : certificates) {
    step.lines.push_back(what + ": " + certificate->SubjectName() + ", valid until " +
                         certificate->NotAfter().ToString());
    step.details["certificates"].push_back(
        {{"use", what},
         {"subject", certificate->SubjectName()},
         {"notBefore", certificate->NotBefore().ToString()},
         {"notAfter", certificate->NotAfter().ToString()},
         {"fingerprint", Tarnik::Crypto::FingerprintText(*certificate)}});
  }
}

// Records the worst problem.
void Note(Step& step, const std::optional<Finding>& problem) {
  if (problem &&
      (step.finding.outcome == StepOutcome::kOk || (step.finding.outcome == StepOutcome::kWarning &&
                                                    problem->outcome == StepOutcome::kFailed))) {
    step.finding = *problem;
  }
}

Finding UnusableFile(FindingName name, const std::string& path, const std::string& reason) {
  return Failure(ExitStatus::kLocal, name, "'" + path + "': " + reason,
                 "give a PEM file (DER is possible only for --sts-certificate)");
}

void ExamineCa(Step& step, const std::string& path, const Tarnik::System::DateTime& now) {
  if (const auto problem = FileProblem(path)) {
    Note(step, problem);
    return;
  }
  try {
    const Certificates certificates = Tarnik::Crypto::LoadCertificates(path);
    Show(step, "ca", certificates);
    for (const auto& certificate : certificates) {
      // A bundle may contain old certificates, and the service's chain decides whether it matters.
      auto problem = ValidityProblem("the CA " + certificate->SubjectName(), *certificate, now,
                                     "get the next certificate of the CA from a trusted source, "
                                     "and give it as --ca too");
      if (problem) {
        problem->outcome = StepOutcome::kWarning;
      }
      Note(step, problem);
    }
  } catch (const Tarnik::Exception& unusable) {
    Note(step, UnusableFile("bad-ca-file", path, unusable.what()));
  }
}

void ExamineList(Step& step, const std::string& path) {
  if (const auto problem = FileProblem(path)) {
    Note(step, problem);
    return;
  }
  try {
    step.lines.push_back(
        "revocation lists: " + std::to_string(Tarnik::Crypto::LoadRevocationLists(path).size()) +
        " in '" + path + "'");
  } catch (const Tarnik::Exception& unusable) {
    Note(step, UnusableFile("bad-revocation-list", path, unusable.what()));
  }
}

void ExamineSigners(Step& step, Examination& examination, const std::string& path,
                    const Tarnik::System::DateTime& now) {
  if (const auto problem = FileProblem(path)) {
    Note(step, problem);
    return;
  }
  try {
    const auto signers = Tarnik::Crypto::LoadPemOrDerCertificates(path);
    examination.signers.insert(examination.signers.end(), signers.begin(), signers.end());
    Show(step, "signer", signers);
    for (const auto& signer : signers) {
      auto problem =
          ValidityProblem("the signing certificate " + signer->SubjectName(), *signer, now,
                          "get the next signing certificate of the service from a trusted source, "
                          "and give it as --sts-certificate too");
      if (problem) {
        problem->outcome = StepOutcome::kWarning;  // the library does not check its validity
      }
      Note(step, problem);
    }
  } catch (const Tarnik::Exception& unusable) {
    Note(step, UnusableFile("bad-sts-certificate", path, unusable.what()));
  }
}

}  // namespace

Step ExamineTrust(Examination& examination) {
  Step step;
  const Plan& plan = examination.plan;
  const Tarnik::System::DateTime now = Tarnik::System::GetUtcDateTime();
  for (const std::string& path : plan.caFiles) {
    ExamineCa(step, path, now);
  }
  for (const std::string& path : plan.crlFiles) {
    ExamineList(step, path);
  }
  for (const std::string& path : plan.stsCertificateFiles) {
    ExamineSigners(step, examination, path, now);
  }
  if (step.finding.outcome == StepOutcome::kFailed) {
    return step;
  }
  try {
    examination.sslContext = plan.makeSslContext();
  } catch (const std::exception& unusable) {
    step.finding = Failure(ExitStatus::kLocal, "trust-unusable", unusable.what(),
                           plan.caFiles.empty()
                               ? "install the CAs of the system (ca-certificates), or give --ca"
                               : "check the files of --ca and --tls-crl");
    return step;
  }
  if (step.finding.outcome == StepOutcome::kOk) {
    step.finding.message =
        plan.caFiles.empty()
            ? "the CAs of this system are trusted"
            : CountText(static_cast<long>(plan.caFiles.size()), "CA file") + " trusted";
  }
  return step;
}

}  // namespace SsoClient::Tool::Doctor
