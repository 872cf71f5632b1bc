#include <tarnik/text/display_text.h>

#include "doctor/steps.h"
#include "doctor/token_findings.h"

namespace SsoClient::Tool::Doctor {
namespace {

constexpr std::size_t kShownSubject = 256;
constexpr long kMicrosecondsOfSecond = 1000000;
// Clocks that are synchronised may still differ by some seconds.
constexpr long kToleranceSec = 5;

}  // namespace

Finding FindingOfValidity(const Tarnik::System::DateTime& start,
                          const Tarnik::System::DateTime& end,
                          const Tarnik::System::DateTime& now) {
  const long untilStart = (start.GetUtcTime() - now.GetUtcTime()) / kMicrosecondsOfSecond;
  const long untilEnd = (end.GetUtcTime() - now.GetUtcTime()) / kMicrosecondsOfSecond;
  const char* remedy = "synchronise the clocks of this machine and the service";
  if (untilStart > kToleranceSec) {
    return Warning(ExitStatus::kLocal, "token-not-yet-valid",
                   "by the clock of this machine the token is valid only in " +
                       std::to_string(untilStart) + " s",
                   remedy);
  }
  if (untilEnd <= 0) {
    return Warning(ExitStatus::kLocal, "token-already-expired",
                   "by the clock of this machine the new token has expired " +
                       std::to_string(-untilEnd) + " s ago",
                   remedy);
  }
  return Fine("valid for another " + std::to_string(untilEnd) + " s");
}

Step ExamineToken(Examination& examination) {
  Step step;
  if (!examination.token) {
    step.finding = NotNeeded("no login was asked for");
    return step;
  }
  const SamlToken& token = *examination.token;
  step.finding = FindingOfValidity(token.StartTime(), token.ExpirationTime(),
                                   Tarnik::System::GetUtcDateTime());
  const std::string subject =
      Tarnik::ToDisplayText(token.Subject().name + "@" + token.Subject().domain, kShownSubject);
  const std::string issuer = Tarnik::ToDisplayText(token.Issuer(), kShownSubject);
  step.lines = {
      "subject: " + subject, "issuer: " + issuer,
      "valid from " + token.StartTime().ToString() + " until " + token.ExpirationTime().ToString()};
  step.details = {{"subject", subject},
                  {"issuer", issuer},
                  {"notBefore", token.StartTime().ToString()},
                  {"notOnOrAfter", token.ExpirationTime().ToString()}};
  return step;
}

}  // namespace SsoClient::Tool::Doctor
