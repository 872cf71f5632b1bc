#ifndef SSOCLIENT_TESTS_SUPPORT_TOKEN_VALUES_H
#define SSOCLIENT_TESTS_SUPPORT_TOKEN_VALUES_H

#include <string>

#include <ssoclient/saml_token.h>

namespace SsoClient::Testing {

/// Everything that a token tells but its text, in one text: two tokens that tell the same give the
/// same.
std::string AllValues(const SamlToken& token);

}  // namespace SsoClient::Testing

#endif
