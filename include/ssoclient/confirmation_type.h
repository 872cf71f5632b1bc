#ifndef SSOCLIENT_CONFIRMATION_TYPE_H
#define SSOCLIENT_CONFIRMATION_TYPE_H

#include <cstdint>

namespace SsoClient {

/// How the subject of a requested token is to be confirmed. Only zero and non-zero are told apart.
enum ConfirmationType : std::int32_t {
  /// Holder-of-key when the service has a holder-of-key configuration, bearer otherwise (KeyType,
  /// WS-Trust 1.3, section 9.2).
  CONFIRMATION_DEFAULT = 0,
  /// Always bearer.
  CONFIRMATION_BEARER = 1,
};

/// How the subject of an issued token is confirmed (SAML 2.0 profiles, section 3).
enum TokenConfirmationType : std::int32_t {
  /// "urn:oasis:names:tc:SAML:2.0:cm:bearer": whoever has the token is taken for its subject.
  BEARER = 0,
  /// "urn:oasis:names:tc:SAML:2.0:cm:holder-of-key": only who proves to have the key is.
  HOLDER_OF_KEY = 1,
};

}  // namespace SsoClient

#endif
