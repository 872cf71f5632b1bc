#ifndef SSOCLIENT_CONFIRMATION_TYPE_H
#define SSOCLIENT_CONFIRMATION_TYPE_H

#include <cstdint>

namespace SsoClient {

/// How the subject of a requested token is to be confirmed. All non-zero values mean the same.
enum ConfirmationType : std::int32_t {
  /// Holder-of-key when the service has a holder-of-key configuration, bearer otherwise (KeyType,
  /// WS-Trust 1.3, section 9.2).
  CONFIRMATION_DEFAULT = 0,
  /// Always bearer.
  CONFIRMATION_BEARER = 1,
};

/// How the subject of an issued token is confirmed (SAML 2.0 profiles, section 3).
enum TokenConfirmationType : std::int32_t {
  /// "urn:oasis:names:tc:SAML:2.0:cm:bearer": whoever presents the token counts as its subject.
  BEARER = 0,
  /// "urn:oasis:names:tc:SAML:2.0:cm:holder-of-key": only whoever proves possession of the key
  /// does.
  HOLDER_OF_KEY = 1,
};

}  // namespace SsoClient

#endif
