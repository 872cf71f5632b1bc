#include "token/validity_rules.h"

#include <ssoclient/exceptions.h>

#include "support/clock_tolerance.h"
#include "support/concat.h"

namespace SsoClient {
namespace {

using Tarnik::System::DateTime;
using Tarnik::System::SaturatingAdd;
using Tarnik::System::SaturatingMultiply;

void CheckIdentity(const ParsedAssertion& assertion) {
  if (assertion.version != "2.0") {
    throw ParseException("Invalid token version");
  }
  if (assertion.id.empty() || assertion.id.front() != '_') {
    throw ParseException("Invalid token ID");
  }
}

void CheckPeriod(const ParsedConditions& conditions, long clockToleranceSec, const DateTime& now) {
  if (conditions.notBefore >= conditions.notOnOrAfter) {
    throw ParseException(
        "Unsatisfiable token validity conditions: NotBefore must be less than NotOnOrAfter.");
  }
  // Multiplied by a negative factor, because the smallest `long` cannot be negated.
  const long backwards = SaturatingMultiply(clockToleranceSec, -kMicrosecondsPerSecond);
  if (SaturatingAdd(conditions.notBefore.GetUtcTime(), backwards) > now.GetUtcTime()) {
    throw ParseException(
        Concat({"Token start date is in the future: ", conditions.notBefore.ToString()}));
  }
  const long forwards = ToleranceMicroseconds(clockToleranceSec);
  if (SaturatingAdd(conditions.notOnOrAfter.GetUtcTime(), forwards) <= now.GetUtcTime()) {
    throw ParseException(
        Concat({"The token has expired at: ", conditions.notOnOrAfter.ToString()}));
  }
}

void CheckBearerConfirmation(const ParsedAssertion& assertion) {
  if (assertion.subject.confirmationMethod == BEARER &&
      assertion.subject.notOnOrAfter < assertion.conditions.notOnOrAfter) {
    throw ParseException("Invalid token subject validity");
  }
}

bool IsSameDelegate(const PrincipalId& a, const PrincipalId& b) {
  return a.name == b.name && a.domain == b.domain;
}

void CheckDelegation(const std::optional<PrincipalId>& delegateId,
                     const std::optional<std::vector<Delegate>>& chain) {
  if (!delegateId && !chain) {
    return;
  }
  if (!delegateId) {
    throw ParseException(
        "Token has delegation restriction, but no delegate id is present in the "
        "SubjectConfirmation");
  }
  if (!chain) {
    throw ParseException(
        "Token SubjectConfirmation contains delegate id, but no delegation restriction is present");
  }
  if (chain->empty() || !IsSameDelegate(*delegateId, chain->back().delegate)) {
    throw ParseException(
        "The SubjectConfirmation delegate id does not match the id of the last delegate");
  }
}

}  // namespace

void CheckValidity(const ParsedAssertion& assertion, long clockToleranceSec, const DateTime& now) {
  CheckIdentity(assertion);
  CheckPeriod(assertion.conditions, clockToleranceSec, now);
  CheckBearerConfirmation(assertion);
  CheckDelegation(assertion.subject.delegateId, assertion.conditions.delegationChain);
}

}  // namespace SsoClient
