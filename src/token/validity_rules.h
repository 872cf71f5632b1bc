#ifndef SSOCLIENT_TOKEN_VALIDITY_RULES_H
#define SSOCLIENT_TOKEN_VALIDITY_RULES_H

#include <tarnik/system/date_time.h>

#include "token/parsed_assertion.h"

namespace SsoClient {

/// A clock tolerance in microseconds, held at the ends of the 64-bit range.
long ToleranceMicroseconds(long clockToleranceSec) noexcept;

/// Throws `ParseException` unless the assertion is of SAML version 2.0, has a proper ID, is valid
/// at `now` give or take the tolerance, and its delegation chain fits its subject confirmation.
void CheckValidity(const ParsedAssertion& assertion, long clockToleranceSec,
                   const Tarnik::System::DateTime& now);

}  // namespace SsoClient

#endif
