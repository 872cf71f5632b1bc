#ifndef SSOCLIENT_TESTS_TOKEN_VALUES_H
#define SSOCLIENT_TESTS_TOKEN_VALUES_H

#include <ssoclient/saml_token.h>

#include <string>

namespace TestSupport {

/// Everything that a token tells but its text, in one text: two tokens that tell the same give the
/// same.
std::string AllValues(const SsoClient::SamlToken& token);

}  // namespace TestSupport

#endif
