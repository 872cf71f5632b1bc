#ifndef SSOCLIENT_TOOL_TOKEN_CONFIRMATION_NAME_H
#define SSOCLIENT_TOOL_TOKEN_CONFIRMATION_NAME_H

#include <ssoclient/confirmation_type.h>

namespace SsoClient::Tool {

/// "bearer" or "holder-of-key" (SAML 2.0 Profiles, section 3): how the subject is confirmed.
inline const char* ConfirmationName(TokenConfirmationType type) {
  return type == BEARER ? "bearer" : "holder-of-key";
}

}  // namespace SsoClient::Tool

#endif
