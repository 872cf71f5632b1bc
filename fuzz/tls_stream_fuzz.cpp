// The records of a TLS server arrive in pieces, changed, lost, twice, in another order or cut off,
// as the input says. The data that a stream reads is always the beginning of what the server has
// sent, its end is reported only at the server's close_notify, failures are typed, and every
// operation ends exactly once. Without a fault everything arrives, in both directions.
#include <algorithm>
#include <optional>
#include <string>

#include <fuzzer/FuzzedDataProvider.h>
#include <openssl/err.h>
#include <openssl/pem.h>

#include <devsts/certificates.h>
#include <tarnik/core/exception.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/ssl/ssl_exception.h>

#include "fixed_random.h"
#include "input.h"
#include "single_thread.h"
#include "tls_server.h"

namespace {

using namespace Tarnik;

struct Pki {
  DevSts::Credential ca;
  DevSts::Credential server;
  DevSts::Credential stranger;
};

const Pki& ThePki() {
  static const Pki pki = [] {
    Fuzz::FixRandomness(1);
    DevSts::CertificateSpec spec;
    spec.commonName = "Root";
    spec.isAuthority = true;
    Pki made;
    made.ca = DevSts::MakeCertificate(spec);
    spec.commonName = "sts.example";
    spec.dnsNames = {"sts.example"};
    spec.isAuthority = false;
    made.server = DevSts::MakeCertificate(spec, &made.ca);
    spec.commonName = "stranger";
    made.stranger = DevSts::MakeCertificate(spec);
    return made;
  }();
  return pki;
}

OpenSsl::OwnedBio Memory(const std::string& text) {
  return OpenSsl::OwnedBio(BIO_new_mem_buf(text.data(), static_cast<int>(text.size())));
}

/// How the peers are set up.
struct Setting {
  bool isTls13;
  bool isTrusted;
  bool isNamed;
  bool asksForCertificate;
  bool hasCertificate;

  explicit Setting(FuzzedDataProvider& input)
      : isTls13(input.ConsumeBool()),
        isTrusted(input.ConsumeIntegralInRange(0, 7) != 7),
        isNamed(input.ConsumeIntegralInRange(0, 7) != 7),
        asksForCertificate(input.ConsumeIntegralInRange(0, 3) == 3),
        hasCertificate(input.ConsumeBool()) {}

  bool IsAcceptable() const {
    return isTrusted && isNamed && (hasCertificate || !asksForCertificate);
  }
};

OpenSsl::OwnedSslContext ServerContext(const Setting& setting) {
  OpenSsl::OwnedSslContext context(SSL_CTX_new(TLS_server_method()));
  const int version = setting.isTls13 ? TLS1_3_VERSION : TLS1_2_VERSION;
  SSL_CTX_set_min_proto_version(context.get(), version);
  SSL_CTX_set_max_proto_version(context.get(), version);
  const DevSts::Credential& own = setting.isTrusted ? ThePki().server : ThePki().stranger;
  const OpenSsl::OwnedCertificate certificate(
      PEM_read_bio_X509(Memory(own.certificatePem).get(), nullptr, nullptr, nullptr));
  const OpenSsl::OwnedKey key(
      PEM_read_bio_PrivateKey(Memory(own.privateKeyPem).get(), nullptr, nullptr, nullptr));
  Fuzz::Require(SSL_CTX_use_certificate(context.get(), certificate.get()) == 1 &&
                SSL_CTX_use_PrivateKey(context.get(), key.get()) == 1);
  SSL_CTX_set_session_id_context(context.get(), reinterpret_cast<const unsigned char*>("f"), 1);
  if (setting.asksForCertificate) {
    SSL_CTX_set_verify(context.get(), SSL_VERIFY_PEER | SSL_VERIFY_FAIL_IF_NO_PEER_CERT,
                       [](int, X509_STORE_CTX*) { return 1; });
  }
  return context;
}

Ref<Ssl::SSLContext> ClientContext(const Setting& setting) {
  Ssl::SSLContextConfig config;
  config.caCertificates = Crypto::CreateCertificatesFromPem(ThePki().ca.certificatePem);
  if (setting.hasCertificate) {
    const DevSts::Credential& own = ThePki().stranger;
    config.clientCertificate = Crypto::CreateCertificatesFromPem(own.certificatePem).front();
    config.clientPrivateKey = Crypto::CreatePrivateKeyFromPem(own.privateKeyPem);
  }
  return Ssl::CreateSSLContext(config);
}

/// The end of one operation.
struct Outcome {
  int count = 0;
  bool hasFailed = false;
  std::size_t size = 0;

  void Report(const Exception* error, std::size_t bytes = 0) {
    Fuzz::Require(++count == 1);
    hasFailed = error != nullptr;
    size = bytes;
    Fuzz::Require(error == nullptr || dynamic_cast<const Ssl::SSLException*>(error) != nullptr ||
                  dynamic_cast<const IOException*>(error) != nullptr ||
                  dynamic_cast<const CancelledException*>(error) != nullptr);
  }
  bool HasSucceeded() const { return count == 1 && !hasFailed; }
};

/// One connection of a client.
class Connection {
 public:
  Connection(Ssl::SSLContext& context, SSL_CTX* serverContext, FuzzedDataProvider& input)
      : input_(input),
        server_(MakeRef<Fuzz::TlsServer>(serverContext, input)),
        stream_(context.WrapStream(server_.get(), "")) {}

  void Run(const Setting& setting) {
    Outcome handshake;
    stream_->HandshakeClientAsync(setting.isNamed ? "sts.example" : "other.example", "",
                                  [&](Exception* error) { handshake.Report(error); });
    Finish(handshake);
    const bool isConnected = handshake.HasSucceeded();
    // With TLS 1.3, the server refuses a client without a certificate only after the handshake.
    const bool mayLackCertificate = setting.isTls13 && setting.isTrusted && setting.isNamed;
    Fuzz::Require(!isConnected || setting.IsAcceptable() || mayLackCertificate);
    Fuzz::Require(isConnected || !setting.IsAcceptable() || !server_->IsClean());
    if (isConnected) {
      Exchange(setting);
    }
    stream_->Close();
    Settle();
  }

 private:
  void Exchange(const Setting& setting) {
    std::string request(input_.ConsumeIntegralInRange<std::size_t>(0, 40'000), 'q');
    for (std::size_t i = 0; i < request.size(); ++i) {
      request[i] = static_cast<char>('A' + i % 29);
    }
    Outcome written;
    stream_->WriteAsync(request.data(), request.size(),
                        [&](Exception* error) { written.Report(error); });
    const bool isComplete = ReadAll();
    Finish(written);
    const std::string& received = server_->Received();
    Fuzz::Require(request.compare(0, received.size(), received) == 0);
    if (server_->IsClean() && setting.IsAcceptable()) {
      Fuzz::Require(read_ == server_->Sent());
      Fuzz::Require(isComplete == server_->HasSentCloseNotify());
      Fuzz::Require(received == request);
    }
  }

  /// Reads to the end; true if that is the end of the data.
  bool ReadAll() {
    std::string buffer;
    for (;;) {
      buffer.assign(input_.ConsumeIntegralInRange<std::size_t>(1, 20'000), '\0');
      Outcome outcome;
      stream_->ReadAsync(buffer.data(), buffer.size(), [&](std::size_t bytes, Exception* error) {
        outcome.Report(error, bytes);
      });
      Finish(outcome);
      if (!outcome.HasSucceeded() || outcome.size == 0) {
        const bool isEnd = outcome.HasSucceeded();
        Fuzz::Require(!isEnd || (server_->HasSentCloseNotify() && read_ == server_->Sent()));
        return isEnd;
      }
      Fuzz::Require(outcome.size <= buffer.size());
      read_.append(buffer, 0, outcome.size);
      Fuzz::Require(server_->Sent().compare(0, read_.size(), read_) == 0);
    }
  }

  void Settle() {
    bool hasChanged = true;
    while (hasChanged) {
      hasChanged = Fuzz::RunCompletions();
      hasChanged = server_->Drive() || hasChanged;
    }
  }

  // An operation that waits for more than has arrived ends with the stream or when it is closed.
  void Finish(const Outcome& outcome) {
    Settle();
    if (outcome.count == 0 && input_.ConsumeBool()) {
      stream_->Close();
    } else if (outcome.count == 0) {
      server_->End(input_.ConsumeBool());
    }
    Settle();
    Fuzz::Require(outcome.count == 1);
  }

  FuzzedDataProvider& input_;
  Ref<Fuzz::TlsServer> server_;
  Ref<Ssl::SSLStream> stream_;
  std::string read_;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  Fuzz::RunOnOneThread();
  ThePki();
  Fuzz::FixRandomness(size);
  FuzzedDataProvider input(data, size);
  const Setting setting(input);
  const OpenSsl::OwnedSslContext serverContext = ServerContext(setting);
  const auto context = ClientContext(setting);
  for (int connections = input.ConsumeIntegralInRange(1, 2); connections > 0; --connections) {
    Connection(*context, serverContext.get(), input).Run(setting);
  }
  Fuzz::Require(ERR_peek_error() == 0);
  return 0;
}
