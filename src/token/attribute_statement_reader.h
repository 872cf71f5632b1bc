#ifndef SSOCLIENT_TOKEN_ATTRIBUTE_STATEMENT_READER_H
#define SSOCLIENT_TOKEN_ATTRIBUTE_STATEMENT_READER_H

#include "token/child_cursor.h"
#include "token/parsed_assertion.h"

namespace SsoClient {

/// Reads an AttributeStatement (SAML 2.0 core, section 2.7.3). Attributes of names that mean
/// nothing here are checked for their form and left. Throws `ParseException`.
SubjectAttributes ReadAttributeStatement(ChildCursor& cursor);

}  // namespace SsoClient

#endif
