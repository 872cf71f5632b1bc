#include "token/token_rows.h"

#include <algorithm>
#include <set>
#include <utility>
#include <vector>

#include "output/bar.h"
#include "output/duration_text.h"
#include "output/safe_text.h"
#include "token/unverified_token.h"

namespace SsoClient::Tool {
namespace {

using Tarnik::System::DateTime;

constexpr std::size_t kLabelColumns = 18;
constexpr std::size_t kWidestBar = 50;
constexpr double kLastTenth = 0.9;

class Rows {
 public:
  Rows(const Console& console, Table& table) : console_(console), table_(table) {}

  /// A row whose text is safe already.
  void AddSafe(const std::string& label, const std::string& text,
               std::optional<Colour> colour = std::nullopt) {
    table_.Add({{label, Colour::kFaint}, {text, colour}});
  }
  void Add(const std::string& label, const std::string& text) { AddSafe(label, Safe(text)); }
  /// One line for each text; `none` without any.
  void AddLines(const std::string& label, const std::vector<std::string>& texts,
                const std::string& none) {
    std::string lines;
    for (const std::string& text : texts) {
      lines += (lines.empty() ? "" : "\n") + Safe(text);
    }
    AddSafe(label, texts.empty() ? none : lines);
  }
  std::string Safe(const std::string& text) const { return SafeText(console_, text); }

 private:
  const Console& console_;
  Table& table_;
};

void AddSubject(const SamlToken& token, Rows& rows) {
  SubjectNames names;
  token.GetSubjectNames(names);
  rows.AddSafe("subject", rows.Safe(PrincipalText(token.Subject())), Colour::kStrong);
  const bool hasBoth = !names.givenName.empty() && !names.surname.empty();
  const std::string name = names.givenName + (hasBoth ? " " : "") + names.surname;
  if (!name.empty()) {
    rows.Add("name", name);
  }
  std::vector<PrincipalId> groups;
  token.GetGroups(groups);
  std::vector<std::string> texts;
  texts.reserve(groups.size());
  for (const PrincipalId& group : groups) {
    texts.push_back(group.domain.empty() ? group.name : group.domain + "\\" + group.name);
  }
  rows.AddLines("groups", texts, "none");
}

void AddUse(const SamlToken& token, Rows& rows) {
  std::set<std::string> audiences;
  token.GetAudiences(audiences);
  rows.AddLines("audiences", {audiences.begin(), audiences.end()}, "not restricted to any");
  std::vector<Delegate> chain;
  token.GetDelegationChain(chain);
  std::vector<std::string> texts;
  texts.reserve(chain.size());
  for (const Delegate& each : chain) {
    texts.push_back("to " + PrincipalText(each.delegate) + " on " +
                    TimeText(each.delegationInstant));
  }
  rows.AddLines("delegated", texts, "no");
  std::string flags;
  for (const auto& [isSet, name] :
       {std::pair(token.IsRenewable(), "renewable"), std::pair(token.IsDelegable(), "delegable"),
        std::pair(token.IsSolution(), "solution user")}) {
    flags += isSet ? (flags.empty() ? "" : ", ") + std::string(name) : "";
  }
  rows.AddSafe("flags", flags.empty() ? "none" : flags);
}

void AddKeys(const Console& console, const SamlToken& token, Rows& rows) {
  const auto holder = token.HolderOfKeyCertificate();
  rows.AddSafe("confirmation", holder == nullptr
                                   ? std::string("bearer: whoever has it can use it")
                                   : "holder of the key of\n" + CertificateText(console, *holder));
  rows.Add("issuer", token.Issuer());
  const auto signer = ClaimedSigner(token);
  rows.AddSafe("signer", signer == nullptr ? std::string("the token contains no certificate")
                                           : CertificateText(console, *signer));
  rows.Add("algorithm", SignatureAlgorithmText(token.GetSignature()->SignatureMethod()));
}

void AddAdvice(const SamlToken& token, Rows& rows) {
  std::vector<Advice> advice;
  token.GetAdvice(advice);
  for (const Advice& each : advice) {
    std::vector<std::string> lines{"from " + each.source};
    for (const AdviceAttribute& attribute : each.attributes) {
      std::string line = attribute.name + ":";
      for (const std::string& value : attribute.values) {
        line += (&value == &attribute.values.front() ? " " : ", ") + value;
      }
      lines.push_back(line);
    }
    rows.AddLines("advice", lines, "");
  }
}

std::string ValidityText(const Console& console, const Validity& validity) {
  const std::size_t width = std::min(RemainingColumns(console, kLabelColumns), kWidestBar);
  return PeriodBar(validity.Position(), width, console.isUtf8) + "\n" + validity.ToString() + " (" +
         std::to_string(validity.Percent()) + " % have elapsed)";
}

void AddValidity(const Console& console, const Validity& validity, Rows& rows) {
  rows.AddSafe("start", TimeText(validity.start));
  rows.AddSafe("end", TimeText(validity.end));
  rows.AddSafe("now", TimeText(validity.now));
  rows.AddSafe("lifetime", DurationText(SecondsBetween(validity.start, validity.end)));
  rows.AddSafe("validity", ValidityText(console, validity), ColourOf(validity));
}

}  // namespace

std::string PrincipalText(const PrincipalId& principal) {
  return principal.domain.empty() ? principal.name : principal.name + "@" + principal.domain;
}

std::string CertificateText(const Console& console,
                            const Tarnik::Crypto::Certificate& certificate) {
  return SafeText(console, certificate.SubjectName()) + "\nSHA-256 " +
         Tarnik::Crypto::FingerprintText(certificate) + "\nuntil " +
         TimeText(certificate.NotAfter());
}

Colour ColourOf(const Validity& validity) {
  switch (validity.GetState()) {
    case Validity::State::kExpired:
      return Colour::kBad;
    case Validity::State::kNotYetValid:
      return Colour::kWarning;
    case Validity::State::kValid:
      return validity.Position() < kLastTenth ? Colour::kGood : Colour::kWarning;
  }
  return Colour::kFaint;
}

void AddTokenRows(const Console& console, const SamlToken& token, const DateTime& now,
                  Table& table) {
  Rows rows(console, table);
  AddSubject(token, rows);
  AddUse(token, rows);
  AddKeys(console, token, rows);
  AddAdvice(token, rows);
  rows.Add("id", token.Id());
  AddValidity(console, {token.StartTime(), token.ExpirationTime(), now}, rows);
}

}  // namespace SsoClient::Tool
