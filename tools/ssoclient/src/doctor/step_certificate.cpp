#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/system/date_time.h>

#include "doctor/chain.h"
#include "doctor/library_connection.h"
#include "doctor/steps.h"

namespace SsoClient::Tool::Doctor {
namespace {

void Show(Step& step, const ChainLink& link, std::size_t position) {
  const std::string margin = "   ";
  step.lines.push_back(std::to_string(position) + ": " + link.subject);
  step.lines.push_back(margin + "issuer " + link.issuer);
  step.lines.push_back(margin + "valid from " + link.notBefore.ToString() + " until " +
                       link.notAfter.ToString());
  step.lines.push_back(margin + "SHA-256 " + link.fingerprint);
  std::string names;
  for (const std::string& name : link.names) {
    names += " " + name;
  }
  if (!names.empty()) {
    step.lines.push_back(margin + "for" + names);
  }
  step.details["chain"].push_back({{"subject", link.subject},
                                   {"issuer", link.issuer},
                                   {"notBefore", link.notBefore.ToString()},
                                   {"notAfter", link.notAfter.ToString()},
                                   {"fingerprint", link.fingerprint},
                                   {"names", link.names}});
}

// The library decides whether a login is possible; OpenSSL's own verification says why.
void Compare(Step& step, const LibraryVerdict& verdict) {
  const bool isAccepted = step.finding.outcome != StepOutcome::kFailed;
  step.details["isAcceptedByLibrary"] = verdict.kind == LibraryVerdict::Kind::kAccepted;
  if (!verdict.message.empty()) {
    step.details["libraryMessage"] = verdict.message;
  }
  if (verdict.kind == LibraryVerdict::Kind::kUndecided) {
    step.finding = isAccepted ? Failure(ExitStatus::kUnreachable, "library-cannot-connect",
                                        "a connection of the library failed: " + verdict.message,
                                        "try again; the service may limit connections")
                              : step.finding;
    return;
  }
  const bool accepts = verdict.kind == LibraryVerdict::Kind::kAccepted;
  if (accepts == isAccepted) {
    return;
  }
  const std::string opinion = "the verdicts differ: the library " +
                              std::string(accepts ? "accepts" : "refuses") + " the service (" +
                              verdict.message + "), and the probe found: " + step.finding.message;
  step.finding = Failure(ExitStatus::kUnreachable, "verdicts-differ", opinion,
                         "compare the addresses of the host: they may be different services");
}

}  // namespace

Step ExamineCertificate(Examination& examination) {
  Step step;
  if (!examination.service.isHttps) {
    step.finding = NotNeeded("the URL begins with http");
    return step;
  }
  const Plan& plan = examination.plan;
  ChainFacts facts;
  try {
    facts =
        Verify(examination.tls.chain, {plan.caFiles, plan.crlFiles}, examination.ExpectedName());
  } catch (const Tarnik::Crypto::CryptoException& unreadable) {
    step.finding =
        Failure(ExitStatus::kUnreachable, "not-trusted",
                std::string("a certificate of the service cannot be read: ") + unreadable.what(),
                "have a well-formed certificate issued for the service");
    return step;
  }
  for (std::size_t i = 0; i < facts.links.size(); ++i) {
    Show(step, facts.links[i], i);
  }
  step.finding = FindingOfChain(facts, Tarnik::System::GetUtcDateTime());
  Compare(step, AskLibrary(examination, examination.limit.ForStep()));
  return step;
}

}  // namespace SsoClient::Tool::Doctor
