#include "crypto/pem.h"

#include <climits>
#include <utility>

#include <openssl/crypto.h>
#include <openssl/err.h>
#include <openssl/pem.h>

#include <tarnik/crypto/crypto_exception.h>

namespace Tarnik::Crypto {
namespace {

// PEM_FLAG_SECURE makes OpenSSL overwrite its own buffers too.
constexpr unsigned kFlags = PEM_FLAG_SECURE | PEM_FLAG_EAY_COMPATIBLE;

bool IsEndOfBlocks() {
  const unsigned long error = ERR_peek_last_error();
  return ERR_GET_LIB(error) == ERR_LIB_PEM && ERR_GET_REASON(error) == PEM_R_NO_START_LINE;
}

void Release(void* memory, std::size_t size) noexcept {
  OPENSSL_secure_clear_free(memory, size);
}

}  // namespace

PemBlock::PemBlock(PemBlock&& other) noexcept
    : label_(std::exchange(other.label_, nullptr)),
      header_(std::exchange(other.header_, nullptr)),
      bytes_(std::exchange(other.bytes_, nullptr)),
      length_(std::exchange(other.length_, 0)),
      capacity_(std::exchange(other.capacity_, 0)) {}

PemBlock::~PemBlock() {
  Release(label_, 0);
  Release(header_, 0);
  Release(bytes_, capacity_);
}

bool StartsLikeDer(std::string_view content) noexcept {
  // A sequence with a length of several bytes. In UTF-8, such a byte follows no digit.
  constexpr char kSequence = '\x30';
  return content.size() > 1 && content.front() == kSequence &&
         (static_cast<unsigned char>(content[1]) & 0xC0) == 0x80;
}

const char* DescribeMissingPem(std::string_view text) noexcept {
  return StartsLikeDer(text) ? ": it is DER." : ".";
}

PemReader::PemReader(std::string_view pem) {
  const OpenSsl::ErrorScope errors;
  if (pem.size() > INT_MAX) {
    throw CryptoException("The PEM text is too long.");
  }
  source_.reset(BIO_new_mem_buf(pem.empty() ? "" : pem.data(), static_cast<int>(pem.size())));
  if (source_ == nullptr) {
    throw CryptoException(errors.Describe("The PEM text cannot be read"));
  }
}

bool PemReader::Next(PemBlock& block) {
  const OpenSsl::ErrorScope errors;
  if (PEM_read_bio_ex(source_.get(), &block.label_, &block.header_, &block.bytes_, &block.length_,
                      kFlags) == 1) {
    block.capacity_ = block.Size();
    return true;
  }
  if (!IsEndOfBlocks()) {
    throw CryptoException(errors.Describe("The PEM text is broken"));
  }
  return false;
}

}  // namespace Tarnik::Crypto
