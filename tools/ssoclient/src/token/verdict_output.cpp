#include "token/verdict_output.h"

#include <ostream>

#include "output/duration_text.h"
#include "output/safe_text.h"
#include "output/table.h"
#include "token/token_json.h"
#include "token/token_rows.h"

namespace SsoClient::Tool {
namespace {

using Access::CheckOutcome;
using Access::Reason;
using Access::Remedy;
using Json = nlohmann::json;

struct Mark {
  const char* unicode;
  const char* ascii;
  Colour colour;
};

Mark MarkOf(CheckOutcome outcome) {
  switch (outcome) {
    case CheckOutcome::kPassed:
      return {"✓", "+", Colour::kGood};
    case CheckOutcome::kFailed:
      return {"✗", "x", Colour::kBad};
    case CheckOutcome::kNotReached:
      return {"–", "-", Colour::kFaint};
  }
  return {"?", "?", Colour::kFaint};
}

Cell MarkCell(const Console& console, CheckOutcome outcome) {
  const Mark mark = MarkOf(outcome);
  return {console.isUtf8 ? mark.unicode : mark.ascii, mark.colour};
}

void PrintLedger(const Console& console, const Access::Verdict& verdict) {
  Table table("");
  for (const Access::CheckRecord& record : verdict.Ledger()) {
    const bool isReached = record.outcome != CheckOutcome::kNotReached;
    table.Add(
        {MarkCell(console, record.outcome),
         {Access::NameOf(record.check), isReached ? std::nullopt : std::optional(Colour::kFaint)},
         isReached ? Cell{SafeText(console, record.compared), std::nullopt}
                   : Cell{"not reached", Colour::kFaint}});
  }
  table.Print(console);
}

// What a caller can do about a refusal with `Remedy::kNewToken`.
std::string NeedOfCaller(Reason reason) {
  switch (reason) {
    case Reason::kNoProof:
    case Reason::kWrongProof:
      return "the caller must prove the key of this token, or needs another token";
    case Reason::kTooLarge:
      return "the caller needs a smaller token";
    case Reason::kNotYetValid:
      return "the caller must wait until the token is valid, or needs another token";
    case Reason::kExpired:
      return "the caller needs a token that has not expired";
    case Reason::kUnknownIssuer:
      return "the caller needs a token of an issuer that the service trusts";
    case Reason::kUnknownSigner:
    case Reason::kSignerNotYetValid:
    case Reason::kSignerExpired:
    case Reason::kSignerRevoked:
      return "the caller needs a token that a current, trusted certificate has signed";
    case Reason::kWrongAudience:
    case Reason::kUnrestricted:
      return "the caller needs a token for the audience of the service";
    case Reason::kBearerRefused:
      return "the caller needs a token that is bound to a key";
    case Reason::kTooLongLived:
      return "the caller needs a token with a shorter lifetime";
    case Reason::kTooDeeplyDelegated:
      return "the caller needs a token with fewer delegates";
    default:
      return "the caller needs another token";
  }
}

bool IsAboutTime(Reason reason) {
  return reason == Reason::kExpired || reason == Reason::kNotYetValid;
}

void PrintRefusal(const Console& console, const Access::Verdict& verdict, bool hasOwnTime) {
  const Reason reason = verdict.Refusal();
  console.out << console.Paint(Colour::kBad, "refused") << " (" << Access::NameOf(reason)
              << "): " << SafeText(console, verdict.Message()) << '\n'
              << "  remedy: " << RemedyText(reason) << '\n';
  const std::string hint = OptionHint(reason);
  if (!hint.empty() && !(hasOwnTime && IsAboutTime(reason))) {
    console.out << "  hint: " << hint << '\n';
  }
}

}  // namespace

const char* NameOf(Remedy remedy) noexcept {
  switch (remedy) {
    case Remedy::kNone:
      return "none";
    case Remedy::kNewToken:
      return "new-token";
    case Remedy::kAccess:
      return "access";
    case Remedy::kService:
      return "service";
  }
  return "unknown";
}

std::string RemedyText(Reason reason) {
  switch (RemedyOf(reason)) {
    case Remedy::kNone:
      return {};
    case Remedy::kNewToken:
      return NeedOfCaller(reason) + " (HTTP 401)";
    case Remedy::kAccess:
      return "whoever grants access decides: another token will not help (HTTP 403)";
    case Remedy::kService:
      return "the operator of the service must act: the token may be good (HTTP 503)";
  }
  return {};
}

std::string OptionHint(Reason reason) {
  switch (reason) {
    case Reason::kExpired:
    case Reason::kNotYetValid:
      return "--at checks as of another time";
    case Reason::kUnknownIssuer:
    case Reason::kUnknownSigner:
      return "compare the issuer and the signer in 'ssoclient show' with --sts-certificate and "
             "--issuer";
    case Reason::kRevocationUnknown:
      return "--crl must name a current list of the authority that issued the signer's certificate";
    case Reason::kWrongAudience:
      return "--audience names the service";
    case Reason::kUnrestricted:
      return "--accept-unrestricted, if the service accepts such tokens";
    case Reason::kBearerRefused:
      return "--bearer accept, if the service accepts bearer tokens";
    case Reason::kNoProof:
      return "--tls-certificate names the certificate of the caller's TLS connection";
    case Reason::kTooLarge:
      return "--largest-token sets the limit, if the service accepts larger tokens";
    case Reason::kTooLongLived:
      return "--longest-lifetime sets the limit, if the service accepts longer lifetimes";
    case Reason::kTooDeeplyDelegated:
      return "--deepest-delegation sets the limit, if the service accepts more delegates";
    case Reason::kNotInGroup:
      return "--group names the groups of which the caller must have one";
    default:
      return {};
  }
}

Json VerdictJson(const Access::Verdict& verdict, const Tarnik::System::DateTime& time) {
  Json checks = Json::array();
  for (const Access::CheckRecord& record : verdict.Ledger()) {
    Json check = {{"check", Access::NameOf(record.check)},
                  {"outcome", Access::NameOf(record.outcome)}};
    if (record.outcome != CheckOutcome::kNotReached) {
      check["compared"] = record.compared;
    }
    checks.push_back(check);
  }
  Json json = {
      {"isAccepted", verdict.IsAccepted()}, {"checkedAt", time.ToString()}, {"checks", checks}};
  if (verdict.IsAccepted()) {
    json["token"] = TokenJson(*verdict.Token(), time);
  } else {
    json["reason"] = Access::NameOf(verdict.Refusal());
    json["message"] = verdict.Message();
    json["remedy"] = NameOf(RemedyOf(verdict.Refusal()));
  }
  return json;
}

void PrintVerdict(const Console& console, const Access::Verdict& verdict,
                  const Tarnik::System::DateTime& time, bool hasOwnTime) {
  PrintLedger(console, verdict);
  console.out << '\n';
  if (hasOwnTime) {
    console.out << "as of " << TimeText(time) << ": ";
  }
  if (!verdict.IsAccepted()) {
    PrintRefusal(console, verdict, hasOwnTime);
    return;
  }
  const SamlToken& token = *verdict.Token();
  const Validity validity{token.StartTime(), token.ExpirationTime(), time};
  const bool isTolerated = validity.GetState() != Validity::State::kValid;
  console.out << console.Paint(Colour::kGood, "accepted") << ": "
              << SafeText(console, PrincipalText(token.Subject())) << ", " << validity.ToString()
              << (isTolerated ? " (within the clock tolerance)\n" : "\n");
}

}  // namespace SsoClient::Tool
