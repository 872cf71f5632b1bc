#ifndef SSOCLIENT_TOKEN_NAME_ID_READER_H
#define SSOCLIENT_TOKEN_NAME_ID_READER_H

#include <string_view>

#include "token/child_cursor.h"
#include "token/parsed_assertion.h"

namespace SsoClient {

/// Reads an element of the NameIDType (SAML 2.0 core, section 2.2.2): Issuer or NameID. Throws
/// `ParseException`.
NameId ReadNameId(ChildCursor& cursor, std::string_view localName);

/// Reads a NameID that holds a user principal name.
PrincipalId ReadPrincipal(ChildCursor& cursor);

}  // namespace SsoClient

#endif
