#ifndef TARNIK_CRYPTO_PEM_H
#define TARNIK_CRYPTO_PEM_H

#include <cstddef>
#include <string_view>

#include "support/openssl.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {

/// One block of a PEM text (RFC 7468), or empty. It may contain a private key and is cleansed.
class PemBlock {
 public:
  PemBlock() = default;
  PemBlock(PemBlock&& other) noexcept;
  PemBlock(const PemBlock&) = delete;
  PemBlock& operator=(const PemBlock&) = delete;
  ~PemBlock();

  std::string_view Label() const noexcept { return label_; }
  /// The header lines of RFC 1421, which traditional formats have; may be empty.
  char* Header() const noexcept { return header_; }
  unsigned char* Bytes() const noexcept { return bytes_; }
  /// Mutable, since decryption in place shortens the bytes.
  long& Length() noexcept { return length_; }
  std::size_t Size() const noexcept { return static_cast<std::size_t>(length_); }

 private:
  friend class PemReader;

  char* label_ = nullptr;
  char* header_ = nullptr;
  unsigned char* bytes_ = nullptr;
  long length_ = 0;
  std::size_t capacity_ = 0;
};

/// True for the first bytes of a certificate, key or revocation list in DER (X.690, section 8.1),
/// which are not those of a text in UTF-8.
bool StartsLikeDer(std::string_view content) noexcept;

/// ": it is DER" when `text`, in which no block was found, starts like DER, or
/// nothing; then a full stop. The end of a message.
const char* DescribeMissingPem(std::string_view text) noexcept;

/// Reads the blocks of a PEM text in order.
class PemReader {
 public:
  /// `pem` must outlive the reader. Throws `CryptoException` when it is too long for OpenSSL.
  explicit PemReader(std::string_view pem);

  /// Reads the next block into `block`, which must be empty; false at the end of the text. Throws
  /// `CryptoException` when a block is broken.
  bool Next(PemBlock& block);

 private:
  OpenSsl::OwnedBio source_;
};

}  // namespace Tarnik::Crypto

#endif
