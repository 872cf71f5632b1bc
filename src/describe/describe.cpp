#include "describe/describe.h"

#include <cstdint>
#include <set>
#include <vector>

#include <ssoclient/saml_token.h>
#include <tarnik/text/print.h>

namespace SsoClient {
namespace {

using Tarnik::DatePrintFormatter;
using Tarnik::Detail::ASPrintInternal;
using Tarnik::System::DateTime;

// Writes a separator before an item only when the text so far is not empty, so leading items with
// an empty description leave no trace.
template <class Items>
std::string JoinByLength(const Items& items) {
  std::string text;
  for (const auto& item : items) {
    if (!text.empty()) {
      text += ", ";
    }
    text += Describe(item);
  }
  return text;
}

// Writes a separator between any two items, including empty ones.
template <class Texts>
std::string JoinByPosition(const Texts& items) {
  std::string text;
  bool isFirst = true;
  for (const std::string& item : items) {
    if (!isFirst) {
      text += ", ";
    }
    isFirst = false;
    text += item;
  }
  return text;
}

}  // namespace

std::string Describe(const PrincipalId& principal) {
  return ASPrintInternal("{Name: %1; Domain:%2}", {principal.name, principal.domain});
}

std::string Describe(const PrincipalId* principal) {
  return principal == nullptr ? std::string("(null)") : Describe(*principal);
}

std::string Describe(const Delegate& delegate) {
  return ASPrintInternal("%1 at %2",
                         {Describe(delegate.delegate), delegate.delegationInstant.ToString()});
}

std::string Describe(const AdviceAttribute& attribute) {
  return ASPrintInternal("[source=%1, attributes=[%2]]",
                         {attribute.name, JoinByPosition(attribute.values)});
}

std::string Describe(const Advice& advice) {
  return ASPrintInternal("Advice [source=%1, attributes=[%2]]",
                         {advice.source, JoinByLength(advice.attributes)});
}

std::string Describe(const TokenSpec& spec) {
  return ASPrintInternal(
      "TokenSpec [tokenLifetimeSec=%1, delegable=%2, delegateTo=%3, renewable=%4, "
      "confirmationType=%5,audienceRestriction=%6, advice=[%7]",
      {spec.tokenLifetimeSec, spec.delegable, spec.delegateTo.value_or("<unset>"), spec.renewable,
       static_cast<std::int32_t>(spec.confirmation), JoinByPosition(spec.audienceRestriction),
       JoinByLength(spec.advice)});
}

std::string CreateSamlTokenDescription(const SamlToken& token) {
  std::vector<PrincipalId> groups;
  token.GetGroups(groups);
  std::vector<Delegate> delegationChain;
  token.GetDelegationChain(delegationChain);
  const DateTime& startTime = token.StartTime();
  const DateTime& expirationTime = token.ExpirationTime();
  // Volatile, since compilers assume that a reference is not null and remove the check for it.
  const PrincipalId* const volatile subject = &token.Subject();
  const bool isRenewable = token.IsRenewable();
  const bool isDelegable = token.IsDelegable();
  const bool isSolution = token.IsSolution();
  const auto confirmationType = static_cast<std::int32_t>(token.ConfirmationType());
  return ASPrintInternal(
      "SamlToken [subject=%1, groups=[%2], delegationChain=[%3], startTime=%4, expirationTime=%5, "
      "renewable=%6, delegable=%7, isSolution=%8,confirmationType=%9]",
      {Describe(subject), JoinByLength(groups), JoinByLength(delegationChain),
       DatePrintFormatter(startTime), DatePrintFormatter(expirationTime), isRenewable, isDelegable,
       isSolution, confirmationType});
}

}  // namespace SsoClient
