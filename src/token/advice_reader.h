#ifndef SSOCLIENT_TOKEN_ADVICE_READER_H
#define SSOCLIENT_TOKEN_ADVICE_READER_H

#include <vector>

#include <ssoclient/advice.h>

#include "token/child_cursor.h"

namespace SsoClient {

/// Reads an Advice element (SAML 2.0 core, section 2.6.1), which may contain only the vendor's
/// advice blocks. Throws `ParseException`.
std::vector<Advice> ReadAdvice(ChildCursor& cursor);

}  // namespace SsoClient

#endif
