#include <tarnik/crypto/certificate.h>

#include <openssl/pem.h>

#include <tarnik/crypto/crypto_exception.h>

#include "crypto/certificate_cache.h"
#include "crypto/certificate_impl.h"
#include "crypto/load_file.h"
#include "crypto/pem.h"

namespace Tarnik::Crypto {

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
  PemReader reader(pem);
  std::vector<Ref<const Certificate>> certificates;
  for (;;) {
    PemBlock block;
    if (!reader.Next(block)) {
      break;
    }
    if (block.Label() == PEM_STRING_X509) {
      certificates.push_back(CreateCertificateFromDer(block.Bytes(), block.Size()));
    }
  }
  if (certificates.empty()) {
    throw CryptoException("The PEM text holds no certificate.");
  }
  return certificates;
}

std::vector<Ref<const Certificate>> LoadCertificates(const std::string& path) {
  return LoadFile("certificate", path, {},
                  [](std::string_view pem, const PassphraseCallback& /*passphrase*/) {
                    return CreateCertificatesFromPem(pem);
                  });
}

}  // namespace Tarnik::Crypto
