#ifndef SSOCLIENT_HOLDER_OF_KEY_CONFIG_H
#define SSOCLIENT_HOLDER_OF_KEY_CONFIG_H

#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>

namespace SsoClient {

/// The key that a service proves possession of, so that tokens can be bound to it. Neither field
/// may be null.
struct HolderOfKeyConfig {
  /// The client's certificate. A request that carries it is refused outside its period of validity,
  /// with a tolerance of 600 seconds; `AcquireTokenByToken` carries only the token.
  Tarnik::Ref<const Tarnik::Crypto::Certificate> certificate;
  /// The certificate's private key: RSA of at least 2048 bits. Used only to sign.
  Tarnik::Ref<const Tarnik::Crypto::PrivateKey> privateKey;
};

}  // namespace SsoClient

#endif
