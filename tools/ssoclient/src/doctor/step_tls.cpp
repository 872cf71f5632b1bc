#include "doctor/steps.h"
#include "doctor/tls_findings.h"

namespace SsoClient::Tool::Doctor {
namespace {

TlsFacts FactsOf(const TlsAttempt& attempt) {
  TlsFacts facts;
  facts.protocol = attempt.protocol;
  facts.cipher = attempt.cipher;
  facts.firstOctets = attempt.firstOctets;
  facts.error = attempt.error;
  facts.alert = attempt.alert;
  facts.isConnected = attempt.isConnected;
  facts.isTimedOut = attempt.isTimedOut;
  facts.isClosed = attempt.isClosed;
  facts.asksForCertificate = attempt.asksForCertificate;
  return facts;
}

// Finds out with further connections why the handshake has failed.
void AskFurther(const Examination& examination, TlsFacts& facts) {
  const auto end = examination.limit.ForStep();
  const Address& address = examination.reachable;
  const std::string& name = examination.ExpectedName();
  if (!facts.firstOctets.empty() && !IsTlsRecord(facts.firstOctets)) {
    return;
  }
  if (facts.alert < 0) {
    facts.plainAnswer = TryPlainHttp(address, examination.service.host, end);
  }
  if (IsHttp(facts.plainAnswer)) {
    return;
  }
  facts.oldProtocol = TryTls(address, name, TlsOffer::kOldVersion, end).protocol;
  if (facts.oldProtocol.empty()) {
    facts.weakCipher = TryTls(address, name, TlsOffer::kAnySuite, end).cipher;
  }
}

}  // namespace

Step ExamineTls(Examination& examination) {
  Step step;
  if (!examination.service.isHttps) {
    step.finding = NotNeeded("the URL begins with http");
    return step;
  }
  TlsAttempt& tls = examination.tls;
  tls = TryTls(examination.reachable, examination.ExpectedName(), TlsOffer::kLibrary,
               examination.limit.ForStep());
  TlsFacts facts = FactsOf(tls);
  if (!tls.isDone && tls.isConnected && !tls.isTimedOut) {
    AskFurther(examination, facts);
  }
  step.finding = FindingOfTls(facts, examination.service.port);
  if (tls.isDone) {
    step.details = {{"protocol", tls.protocol},
                    {"cipher", tls.cipher},
                    {"asksForCertificate", tls.asksForCertificate}};
  } else if (tls.alert >= 0) {
    step.details["alert"] = AlertName(tls.alert);
  }
  if (tls.asksForCertificate) {
    step.lines.emplace_back("the service asks for a TLS certificate of the client");
  }
  return step;
}

}  // namespace SsoClient::Tool::Doctor
