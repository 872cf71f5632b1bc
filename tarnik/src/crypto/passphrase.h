#ifndef TARNIK_CRYPTO_PASSPHRASE_H
#define TARNIK_CRYPTO_PASSPHRASE_H

#include <exception>
#include <string>

#include <tarnik/crypto/private_key.h>

namespace Tarnik::Crypto {

/// The passphrase of one load: requested on first use, cleansed by the destructor.
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

  /// A `pem_password_cb` of OpenSSL with this object as its last argument. Since exceptions must
  /// not pass through OpenSSL, they are kept for `RethrowFailure`.
  static int Read(char* buffer, int size, int forWriting, void* passphrase) noexcept;
  /// Throws the exception that `Read` caught, if any.
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
