#ifndef SSOCLIENT_ACCESS_PRESENTER_H
#define SSOCLIENT_ACCESS_PRESENTER_H

#include <string>
#include <vector>

#include <ssoclient/access/export.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/data_signature.h>

namespace SsoClient::Access {

/// What a server knows about the sender of a token, which is compared with the key that a
/// holder-of-key token is bound to (SAML 2.0 profiles, section 3.1). A value; thread-safe as one.
/// One that was moved from proves nothing.
class SSOCLIENT_ACCESS_EXPORT Presenter {
 public:
  /// What the server knows.
  enum class Kind {
    kNobody,          ///< nothing
    kTlsCertificate,  ///< the certificate of the sender's TLS connection
    kSignature,       ///< a signature by the sender
  };

  /// Nothing is known: holder-of-key tokens are refused.
  static Presenter Nobody();
  /// The sender has proved in a TLS handshake that it has the key of `certificate`. A holder-of-key
  /// token must name this certificate: another one of the same key is refused. The server must have
  /// required and verified that proof, as TLS libraries do for client certificates; the certificate
  /// need not be issued by anybody that the server trusts, since the token names it. Null, which
  /// such libraries return for a client without a certificate, counts as `Nobody`. The certificate
  /// must come from the server's own connection: one in a header is a claim of whoever can reach
  /// the server.
  static Presenter WithTlsCertificate(Tarnik::Ref<const Tarnik::Crypto::Certificate> certificate);
  /// The sender has sent `signature`, which is to be one of `data` by the token's key. The proof is
  /// worth what `data` is worth: it must contain something that the server chose for this exchange,
  /// such as a random challenge, and should contain the SHA-256 of the token, so that a signature
  /// made for another exchange or another token with the same key does not fit. Empty data proves
  /// nothing.
  static Presenter WithSignature(std::string data, std::vector<unsigned char> signature,
                                 Tarnik::Crypto::SignatureAlgorithm algorithm);

  /// How the sender has proved a key. `kNobody` also for a null certificate.
  Kind GetKind() const noexcept {
    return kind_ == Kind::kTlsCertificate && certificate_ == nullptr ? Kind::kNobody : kind_;
  }
  /// Null unless the kind is `kTlsCertificate`.
  const Tarnik::Ref<const Tarnik::Crypto::Certificate>& Certificate() const noexcept {
    return certificate_;
  }
  /// Of the kind `kSignature`; of others, empty or without meaning.
  const std::string& Data() const noexcept { return data_; }
  /// The signature of the data; empty, or without meaning, for other kinds.
  const std::vector<unsigned char>& Signature() const noexcept { return signature_; }
  /// The algorithm of the signature; without meaning for other kinds.
  Tarnik::Crypto::SignatureAlgorithm Algorithm() const noexcept { return algorithm_; }

 private:
  Presenter() = default;

  Tarnik::Ref<const Tarnik::Crypto::Certificate> certificate_;
  std::string data_;
  std::vector<unsigned char> signature_;
  Tarnik::Crypto::SignatureAlgorithm algorithm_{};
  Kind kind_ = Kind::kNobody;
};

}  // namespace SsoClient::Access

#endif
