#ifndef TARNIK_CRYPTO_PASSPHRASE_H
#define TARNIK_CRYPTO_PASSPHRASE_H

#include <tarnik/crypto/private_key.h>
#include <exception>
#include <string>

namespace Tarnik::Crypto {

/// The passphrase of one load: asked for when it is first needed, cleansed with this object.
class Passphrase {
 public:
  explicit Passphrase(const PassphraseCallback& callback) noexcept : callback_(callback) {}
  Passphrase(const Passphrase&) = delete;
  Passphrase& operator=(const Passphrase&) = delete;
  ~Passphrase();

  /// The text. Throws `CryptoException` when there is no callback or the text is longer than
  /// OpenSSL takes; what the callback throws passes through.
  const std::string& Get();
  bool WasNeeded() const noexcept { return wasNeeded_; }

  /// OpenSSL's `pem_password_cb`, with this object as its last argument. Since no exception may
  /// cross OpenSSL, it is kept for `RethrowFailure`.
  static int Read(char* buffer, int size, int forWriting, void* passphrase) noexcept;
  /// Throws what `Read` has caught, if anything.
  void RethrowFailure() const;

 private:
  void Ask();

  const PassphraseCallback& callback_;
  std::string text_;
  bool isKnown_ = false;
  bool wasNeeded_ = false;
  std::exception_ptr failure_;
};

}  // namespace Tarnik::Crypto

#endif
