#ifndef SSOCLIENT_TOKEN_SUBJECT_READER_H
#define SSOCLIENT_TOKEN_SUBJECT_READER_H

#include "token/child_cursor.h"
#include "token/parsed_assertion.h"

namespace SsoClient {

/// Reads a Subject: NameID and one SubjectConfirmation (SAML 2.0 core, section 2.4.1). Throws
/// `ParseException`, and what the platform throws for a certificate that cannot be decoded.
ParsedSubject ReadSubject(ChildCursor& cursor);

}  // namespace SsoClient

#endif
