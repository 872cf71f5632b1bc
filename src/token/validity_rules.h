#ifndef SSOCLIENT_TOKEN_VALIDITY_RULES_H
#define SSOCLIENT_TOKEN_VALIDITY_RULES_H

#include <tarnik/system/date_time.h>

#include "token/parsed_assertion.h"

namespace SsoClient {

/// Throws `ParseException` unless the assertion is of SAML version 2.0, has a valid ID, is valid at
/// `now` within the tolerance, and its delegation chain matches its subject confirmation.
void CheckValidity(const ParsedAssertion& assertion, long clockToleranceSec,
                   const Tarnik::System::DateTime& now);

}  // namespace SsoClient

#endif
