#ifndef SSOCLIENT_TOKEN_CONDITIONS_READER_H
#define SSOCLIENT_TOKEN_CONDITIONS_READER_H

#include "token/child_cursor.h"
#include "token/parsed_assertion.h"

namespace SsoClient {

/// Reads Conditions (SAML 2.0 core, section 2.5.1) with the restrictions that this library knows,
/// in any order and each at most once. An unknown condition would make the assertion's validity
/// indeterminate, so it is rejected. Throws `ParseException`.
ParsedConditions ReadConditions(ChildCursor& cursor);

}  // namespace SsoClient

#endif
