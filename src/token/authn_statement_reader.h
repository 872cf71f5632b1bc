#ifndef SSOCLIENT_TOKEN_AUTHN_STATEMENT_READER_H
#define SSOCLIENT_TOKEN_AUTHN_STATEMENT_READER_H

#include "token/child_cursor.h"
#include "token/parsed_assertion.h"

namespace SsoClient {

/// Reads an AuthnStatement (SAML 2.0 core, section 2.7.2). Throws `ParseException`.
AuthnStatement ReadAuthnStatement(ChildCursor& cursor);

}  // namespace SsoClient

#endif
