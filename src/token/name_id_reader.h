#ifndef SSOCLIENT_TOKEN_NAME_ID_READER_H
#define SSOCLIENT_TOKEN_NAME_ID_READER_H

#include <string_view>

#include <ssoclient/principal_id.h>

#include "token/child_cursor.h"
#include "token/parsed_assertion.h"

namespace SsoClient {

/// The principal of a name id in the user-principal-name format, "name@domain", which is split at
/// the last at sign. Throws `ParseException` for another format or an empty or missing part.
PrincipalId PrincipalFromNameId(std::string_view format, std::string_view value);

/// The group of the text "domain\group", which is split at the first backslash. Throws
/// `ParseException` for an empty or missing part.
PrincipalId PrincipalFromGroupIdentity(std::string_view value);

/// Reads an element of the NameIDType (SAML 2.0 core, section 2.2.2): Issuer or NameID. Throws
/// `ParseException`.
NameId ReadNameId(ChildCursor& cursor, std::string_view localName);

/// Reads a NameID that is a user principal name. Throws `ParseException`.
PrincipalId ReadPrincipal(ChildCursor& cursor);

}  // namespace SsoClient

#endif
