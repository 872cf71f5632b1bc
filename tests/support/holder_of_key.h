#ifndef SSOCLIENT_TESTS_SUPPORT_HOLDER_OF_KEY_H
#define SSOCLIENT_TESTS_SUPPORT_HOLDER_OF_KEY_H

#include <chrono>

#include <devsts/certificates.h>
#include <ssoclient/holder_of_key_config.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>

namespace SsoClient::Testing {

inline DevSts::Credential KeyCredential(DevSts::KeyType keyType = DevSts::KeyType::Rsa2048,
                                        std::chrono::seconds notBefore = std::chrono::hours(-1),
                                        std::chrono::seconds notAfter = std::chrono::hours(1)) {
  DevSts::CertificateSpec spec;
  spec.commonName = "holder";
  spec.keyType = keyType;
  spec.notBefore = notBefore;
  spec.notAfter = notAfter;
  return DevSts::MakeCertificate(spec);
}

inline HolderOfKeyConfig ConfigOf(const DevSts::Credential& credential) {
  return {Tarnik::Crypto::CreateCertificatesFromPem(credential.certificatePem).front(),
          Tarnik::Crypto::CreatePrivateKeyFromPem(credential.privateKeyPem)};
}

}  // namespace SsoClient::Testing

#endif
