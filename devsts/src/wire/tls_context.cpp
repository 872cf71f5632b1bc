#include "wire/tls_context.h"

#include "wire/connection.h"

namespace DevSts {
namespace {

constexpr std::chrono::hours kDay{24};

Credential MakeIntermediate(const Credential& authority) {
  CertificateSpec spec;
  spec.commonName = "Dev STS intermediate CA";
  spec.notAfter = kCertificateLifetime;
  spec.isAuthority = true;
  return MakeCertificate(spec, &authority);
}

CertificateSpec SpecFor(const TlsOptions& options) {
  CertificateSpec spec;
  spec.commonName = "Dev STS server";
  spec.notAfter = kCertificateLifetime;
  spec.dnsNames = {"localhost"};
  spec.addresses = {"127.0.0.1", "::1"};
  switch (options.certificate) {
    case ServerCertificate::Expired:
      spec.notBefore = -30 * kDay;
      spec.notAfter = -kDay;
      break;
    case ServerCertificate::NotYetValid:
      spec.notBefore = kDay;
      break;
    case ServerCertificate::WrongHost:
      spec.dnsNames = {"elsewhere.example"};
      spec.addresses.clear();
      break;
    case ServerCertificate::NameOnlyInCommonName:
      spec.commonName = "localhost";
      spec.dnsNames.clear();
      spec.addresses.clear();
      break;
    case ServerCertificate::AddressAsDnsName:
      spec.dnsNames = {"127.0.0.1", "::1"};
      spec.addresses.clear();
      break;
    case ServerCertificate::NulInName:
      spec.dnsNames = {std::string("localhost\0.elsewhere.example", 28)};
      spec.addresses.clear();
      break;
    case ServerCertificate::Custom:
      spec.dnsNames = options.dnsNames;
      spec.addresses = options.addresses;
      break;
    case ServerCertificate::Valid:
    case ServerCertificate::ThroughIntermediate:
    case ServerCertificate::MissingIntermediate:
    case ServerCertificate::SelfSigned:
      break;
  }
  return spec;
}

void Require(bool done, const char* what) {
  if (!done) {
    ThrowOpenSslError(what);
  }
}

void SetProtocol(SSL_CTX* context, TlsProtocol protocol) {
  int lowest = TLS1_2_VERSION;
  int highest = TLS1_3_VERSION;
  const char* ciphers = nullptr;
  if (protocol == TlsProtocol::Tls12Only) {
    highest = TLS1_2_VERSION;
  }
  if (protocol == TlsProtocol::Tls11Only) {
    lowest = highest = TLS1_1_VERSION;
    ciphers = "ALL:@SECLEVEL=0";
  }
  if (protocol == TlsProtocol::AnonymousSuites) {
    highest = TLS1_2_VERSION;
    ciphers = "aNULL:@SECLEVEL=0";
    SSL_CTX_set_dh_auto(context, 1);
  }
  Require(SSL_CTX_set_min_proto_version(context, lowest) == 1 &&
              SSL_CTX_set_max_proto_version(context, highest) == 1,
          "protocol version");
  Require(ciphers == nullptr || SSL_CTX_set_cipher_list(context, ciphers) == 1, "cipher list");
}

void SetCertificate(SSL_CTX* context, const ServerIdentity& identity) {
  const CertificateHandle certificate = LoadCertificate(identity.credential.certificatePem);
  const KeyHandle key = LoadPrivateKey(identity.credential.privateKeyPem);
  Require(SSL_CTX_use_certificate(context, certificate.get()) == 1 &&
              SSL_CTX_use_PrivateKey(context, key.get()) == 1,
          "server certificate");
  if (identity.chainPem.empty()) {
    return;
  }
  const CertificateHandle intermediate = LoadCertificate(identity.chainPem);
  Require(SSL_CTX_add1_chain_cert(context, intermediate.get()) == 1, "certificate chain");
}

void RequireClients(SSL_CTX* context, const Credential& authority) {
  const CertificateHandle certificate = LoadCertificate(authority.certificatePem);
  Require(X509_STORE_add_cert(SSL_CTX_get_cert_store(context), certificate.get()) == 1 &&
              SSL_CTX_add_client_CA(context, certificate.get()) == 1,
          "client CA");
  SSL_CTX_set_verify(context, SSL_VERIFY_PEER | SSL_VERIFY_FAIL_IF_NO_PEER_CERT, nullptr);
}

void SetResumption(SSL_CTX* context, bool enabled) {
  static constexpr unsigned char kContextId[] = "devsts";
  Require(SSL_CTX_set_session_id_context(context, kContextId, sizeof kContextId - 1) == 1,
          "session context");
  if (!enabled) {
    SSL_CTX_set_session_cache_mode(context, SSL_SESS_CACHE_OFF);
    SSL_CTX_set_options(context, SSL_OP_NO_TICKET);
    SSL_CTX_set_num_tickets(context, 0);
  }
}

}  // namespace

ServerIdentity MakeServerIdentity(const TlsOptions& options, const Credential& authority) {
  const CertificateSpec spec = SpecFor(options);
  if (options.certificate == ServerCertificate::SelfSigned) {
    return {MakeCertificate(spec), {}};
  }
  const bool sendsChain = options.certificate == ServerCertificate::ThroughIntermediate;
  if (!sendsChain && options.certificate != ServerCertificate::MissingIntermediate) {
    return {MakeCertificate(spec, &authority), {}};
  }
  const Credential intermediate = MakeIntermediate(authority);
  return {MakeCertificate(spec, &intermediate), sendsChain ? intermediate.certificatePem : ""};
}

SslContextHandle MakeTlsContext(const TlsOptions& options, const ServerIdentity& identity,
                                const Credential& authority) {
  SslContextHandle context(SSL_CTX_new(TLS_server_method()));
  Require(context != nullptr, "TLS context");
  // OpenSSL must not add certificates from a store to the chain, because some chains are incomplete
  // on purpose.
  SSL_CTX_set_mode(context.get(), SSL_MODE_NO_AUTO_CHAIN);
  SetProtocol(context.get(), options.protocol);
  SetCertificate(context.get(), identity);
  SetResumption(context.get(), options.sessionResumption);
  Connection::Prepare(context.get());
  if (options.requireClientCertificate) {
    RequireClients(context.get(), authority);
  }
  return context;
}

}  // namespace DevSts
