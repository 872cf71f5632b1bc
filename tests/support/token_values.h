#ifndef SSOCLIENT_TESTS_SUPPORT_TOKEN_VALUES_H
#define SSOCLIENT_TESTS_SUPPORT_TOKEN_VALUES_H

#include <string>

#include <ssoclient/saml_token.h>

namespace SsoClient::Testing {

/// All values of a token except its text, in one string: tokens with the same values give the same
/// string.
std::string AllValues(const SamlToken& token);

}  // namespace SsoClient::Testing

#endif
