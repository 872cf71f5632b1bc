#ifndef SSOCLIENT_CONFIRMATION_TYPE_H
#define SSOCLIENT_CONFIRMATION_TYPE_H

#include <cstdint>

namespace SsoClient {

/// How the subject of a requested token is to be confirmed. Only zero and non-zero are told apart.
enum ConfirmationType : std::int32_t {
  /// Holder-of-key when the service has a holder-of-key configuration, bearer otherwise.
  CONFIRMATION_DEFAULT = 0,
  /// Always bearer.
  CONFIRMATION_BEARER = 1,
};

/// How the subject of an issued token is confirmed (SAML 2.0 profiles, section 3).
enum TokenConfirmationType : std::int32_t {
  BEARER = 0,
  HOLDER_OF_KEY = 1,
};

}  // namespace SsoClient

#endif
