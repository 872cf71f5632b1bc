#include "keys.h"

#include <openssl/pem.h>

#include "errors.h"
#include "signing/certificates.h"
#include "signing/openssl_handles.h"

namespace DevSts::Program {
namespace {

void RequireKey(bool condition, const std::string& name, const char* what) {
  if (!condition) {
    throw FileError(name + ": " + what);
  }
}

void CheckPair(const std::string& name, const Credential& credential) {
  try {
    const CertificateHandle certificate = LoadCertificate(credential.certificatePem);
    RequireKey(X509_cmp_current_time(X509_get0_notAfter(certificate.get())) > 0, name + ".pem",
               "the certificate has expired");
    RequireKey(IsCurrent(credential.certificatePem), name + ".pem",
               "the certificate is not valid yet");
  } catch (const ProgramError&) {
    throw;
  } catch (const std::runtime_error& error) {
    throw FileError(name + ".pem: " + error.what());
  }
  try {
    const KeyHandle key = LoadPrivateKey(credential.privateKeyPem);
    const CertificateHandle certificate = LoadCertificate(credential.certificatePem);
    RequireKey(X509_check_private_key(certificate.get(), key.get()) == 1, name + "-key.pem",
               "the key does not belong to the certificate");
  } catch (const ProgramError&) {
    throw;
  } catch (const std::runtime_error& error) {
    throw FileError(name + "-key.pem: " + error.what());
  }
}

KeyType TypeOf(const std::string& keyPem) {
  const KeyHandle key = LoadPrivateKey(keyPem);
  const int bits = EVP_PKEY_get_bits(key.get());
  if (EVP_PKEY_is_a(key.get(), "EC") == 1) {
    return bits == 256 ? KeyType::EcP256 : KeyType::EcP384;
  }
  if (bits == 2048) {
    return KeyType::Rsa2048;
  }
  return bits == 1024 ? KeyType::Rsa1024 : KeyType::Rsa3072;
}

}  // namespace

Keys MakeKeys(const KeyPlan& plan) {
  CertificateSpec spec;
  spec.notAfter = plan.validity;
  spec.freshKey = true;

  Keys keys;
  spec.commonName = "Dev STS CA";
  spec.isAuthority = true;
  keys.authority = MakeCertificate(spec);
  spec.isAuthority = false;

  spec.commonName = "Dev STS signing";
  spec.keyType = plan.signingKey;
  keys.signing = MakeCertificate(spec, plan.signingByAuthority ? &keys.authority : nullptr);

  spec.commonName = "machine";
  spec.keyType = KeyType::Rsa2048;
  keys.client = MakeCertificate(spec, &keys.authority);

  spec.commonName = "Dev STS server";
  spec.keyType = KeyType::EcP256;
  spec.dnsNames = {"localhost"};
  spec.addresses = {"127.0.0.1", "::1"};
  keys.server = MakeCertificate(spec, &keys.authority);
  return keys;
}

void CheckKeys(const Keys& keys, const KeyPlan& plan) {
  CheckPair("ca", keys.authority);
  CheckPair("server", keys.server);
  CheckPair("signing", keys.signing);
  CheckPair("client", keys.client);
  const std::string& authority = keys.authority.certificatePem;
  RequireKey(IsIssuedBy(keys.server.certificatePem, authority), "server.pem",
             "the certificate was not issued by ca.pem");
  RequireKey(IsIssuedBy(keys.client.certificatePem, authority), "client.pem",
             "the certificate was not issued by ca.pem");
  RequireKey(!plan.signingByAuthority || IsIssuedBy(keys.signing.certificatePem, authority),
             "signing.pem",
             "the certificate was not issued by ca.pem, as --signing-by-ca requires");
  RequireKey(TypeOf(keys.signing.privateKeyPem) == plan.signingKey, "signing-key.pem",
             "the key is not of the type that --assertion signing-key requires");
}

bool IsIssuedBy(const std::string& certificatePem, const std::string& authorityPem) {
  const CertificateHandle certificate = LoadCertificate(certificatePem);
  const CertificateHandle authority = LoadCertificate(authorityPem);
  return X509_verify(certificate.get(), X509_get0_pubkey(authority.get())) == 1;
}

bool IsRevokedBy(const std::string& listPem, const std::string& certificatePem,
                 const std::string& authorityPem) {
  const BioHandle bio(BIO_new_mem_buf(listPem.data(), static_cast<int>(listPem.size())));
  const RevocationListHandle list(PEM_read_bio_X509_CRL(bio.get(), nullptr, nullptr, nullptr));
  const CertificateHandle authority = LoadCertificate(authorityPem);
  if (!list || X509_CRL_verify(list.get(), X509_get0_pubkey(authority.get())) != 1) {
    ThrowOpenSslError("the revocation list does not load or is not signed by ca.pem");
  }
  const CertificateHandle certificate = LoadCertificate(certificatePem);
  X509_REVOKED* entry = nullptr;
  return X509_CRL_get0_by_serial(list.get(), &entry, X509_get_serialNumber(certificate.get())) == 1;
}

}  // namespace DevSts::Program
