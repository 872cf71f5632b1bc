#include <tarnik/crypto/certificate.h>

#include <openssl/err.h>
#include <openssl/pem.h>

#include <tarnik/crypto/crypto_exception.h>
#include <array>
#include <cerrno>
#include <climits>
#include <cstdio>
#include <system_error>

#include "crypto/certificate_cache.h"
#include "crypto/certificate_impl.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

/// One block of a PEM text. What it holds may be a private key and is cleansed.
class PemBlock {
 public:
  PemBlock() = default;
  PemBlock(const PemBlock&) = delete;
  PemBlock& operator=(const PemBlock&) = delete;
  ~PemBlock() {
    OPENSSL_free(label_);
    OPENSSL_free(header_);
    OPENSSL_clear_free(bytes_, static_cast<std::size_t>(length_));
  }

  /// False when no block is left or the next one is broken.
  bool Read(BIO* source) { return PEM_read_bio(source, &label_, &header_, &bytes_, &length_) == 1; }
  std::string_view Label() const { return label_; }
  const unsigned char* Bytes() const { return bytes_; }
  std::size_t Length() const { return static_cast<std::size_t>(length_); }

 private:
  char* label_ = nullptr;
  char* header_ = nullptr;
  unsigned char* bytes_ = nullptr;
  long length_ = 0;
};

bool IsEndOfBlocks() {
  const unsigned long error = ERR_peek_last_error();
  return ERR_GET_LIB(error) == ERR_LIB_PEM && ERR_GET_REASON(error) == PEM_R_NO_START_LINE;
}

[[noreturn]] void ThrowUnreadable(const std::string& path, int error) {
  throw IOException("The certificate file '" + path +
                    "' cannot be read: " + std::generic_category().message(error) + ".");
}

std::string ReadFile(const std::string& path) {
  const OpenSsl::Owned<std::FILE, std::fclose> file(std::fopen(path.c_str(), "rbe"));
  if (file == nullptr) {
    ThrowUnreadable(path, errno);
  }
  std::string text;
  std::array<char, 4096> buffer;
  while (const std::size_t count = std::fread(buffer.data(), 1, buffer.size(), file.get())) {
    text.append(buffer.data(), count);
  }
  if (std::ferror(file.get()) != 0) {
    ThrowUnreadable(path, errno);
  }
  return text;
}

}  // namespace

Ref<const Certificate> CreateCertificateFromDer(const unsigned char* bytes, std::size_t length) {
  if (bytes == nullptr) {
    throw CryptoException("A certificate cannot be empty.");
  }
  CertificateCache& cache = ProcessCertificateCache();
  if (auto known = cache.Find({reinterpret_cast<const char*>(bytes), length})) {
    return known;
  }
  Ref<const Certificate> certificate(
      new CertificateImpl(std::vector<unsigned char>(bytes, bytes + length)));
  cache.Add(certificate);
  return certificate;
}

std::vector<Ref<const Certificate>> CreateCertificatesFromPem(std::string_view pem) {
  const OpenSsl::ErrorScope errors;
  if (pem.size() > INT_MAX) {
    throw CryptoException("The PEM text is too long.");
  }
  const OpenSsl::OwnedBio source(BIO_new_mem_buf(pem.data(), static_cast<int>(pem.size())));
  if (source == nullptr) {
    throw CryptoException(errors.Describe("The PEM text cannot be read"));
  }
  std::vector<Ref<const Certificate>> certificates;
  for (;;) {
    PemBlock block;
    if (!block.Read(source.get())) {
      break;
    }
    if (block.Label() == PEM_STRING_X509) {
      certificates.push_back(CreateCertificateFromDer(block.Bytes(), block.Length()));
    }
  }
  if (!IsEndOfBlocks()) {
    throw CryptoException(errors.Describe("The PEM text is broken"));
  }
  if (certificates.empty()) {
    throw CryptoException("The PEM text holds no certificate.");
  }
  return certificates;
}

std::vector<Ref<const Certificate>> LoadCertificates(const std::string& path) {
  return CreateCertificatesFromPem(ReadFile(path));
}

}  // namespace Tarnik::Crypto
