#include "ssl/client_identity.h"

#include <string>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/ssl/ssl_exception.h>

#include "crypto/private_key_impl.h"
#include "ssl/decode_certificate.h"
#include "support/openssl_error.h"

namespace Tarnik::Ssl {
namespace {

void RequireKeyAndCertificate(const SSLContextConfig& config) {
  if (config.clientPrivateKey == nullptr) {
    throw SSLException(
        "The SSL context has a client certificate without the private key that belongs to it.");
  }
  if (config.clientCertificate == nullptr) {
    throw SSLException(
        "The SSL context has a client's private key without the certificate that belongs to it.");
  }
}

const Crypto::PrivateKeyImpl& RequireMatchingKey(const SSLContextConfig& config) {
  const auto* key = dynamic_cast<const Crypto::PrivateKeyImpl*>(config.clientPrivateKey.get());
  if (key == nullptr) {
    throw SSLException("The client's private key was not made by this library.");
  }
  const std::string& subject = config.clientCertificate->SubjectName();
  try {
    if (key->Matches(*config.clientCertificate)) {
      return *key;
    }
  } catch (const Crypto::CryptoException& error) {
    throw SSLException("Cannot use the client certificate " + subject + ": " + error.Message());
  }
  throw SSLException("The client's private key does not belong to the client certificate " +
                     subject + ".");
}

void SetKeyAndCertificate(const SSLContextConfig& config, const Crypto::PrivateKeyImpl& key,
                          SSL_CTX* context) {
  const OpenSsl::ErrorScope errors;
  const OpenSsl::OwnedCertificate certificate = DecodeCertificate(*config.clientCertificate);
  if (certificate == nullptr || SSL_CTX_use_certificate(context, certificate.get()) != 1 ||
      SSL_CTX_use_PrivateKey(context, key.Handle()) != 1) {
    throw SSLException(errors.Describe("Cannot use the client certificate " +
                                       config.clientCertificate->SubjectName()));
  }
}

void AddToChain(const Crypto::Certificate* certificate, SSL_CTX* context) {
  if (certificate == nullptr) {
    throw InvalidArgumentException("A certificate of the client's chain is null.");
  }
  const OpenSsl::ErrorScope errors;
  const OpenSsl::OwnedCertificate decoded = DecodeCertificate(*certificate);
  if (decoded == nullptr || SSL_CTX_add1_chain_cert(context, decoded.get()) != 1) {
    throw SSLException(errors.Describe("Cannot use the certificate " + certificate->SubjectName() +
                                       " in the client's chain"));
  }
}

}  // namespace

void LoadClientIdentity(const SSLContextConfig& config, SSL_CTX* context) {
  // Only the configured chain is sent: by default OpenSSL completes it from the trusted CAs.
  SSL_CTX_set_mode(context, SSL_MODE_NO_AUTO_CHAIN);
  if (config.clientCertificate == nullptr && config.clientPrivateKey == nullptr) {
    if (!config.clientCertificateChain.empty()) {
      throw SSLException("The SSL context has a client's chain without a client certificate.");
    }
    return;
  }
  RequireKeyAndCertificate(config);
  SetKeyAndCertificate(config, RequireMatchingKey(config), context);
  for (const auto& certificate : config.clientCertificateChain) {
    AddToChain(certificate.get(), context);
  }
}

}  // namespace Tarnik::Ssl
