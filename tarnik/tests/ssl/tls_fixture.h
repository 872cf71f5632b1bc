#ifndef TARNIK_TESTS_SSL_TLS_FIXTURE_H
#define TARNIK_TESTS_SSL_TLS_FIXTURE_H

#include <string>

#include <gtest/gtest.h>
#include <openssl/err.h>
#include <openssl/ssl.h>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/system/tcp_client_socket.h>
#include <tarnik/system/thread_pool.h>

#include "support/openssl.h"
#include "support/outcome.h"
#include "support/test_pki.h"

namespace Tarnik::Testing {

/// The certificates that most tests share; created once, since generating keys takes time.
struct TestPki {
  Identity root = MakeCa("Root");
  Identity intermediate = MakeCa("Intermediate", &root);
  Identity leaf = MakeIdentity({}, &root);

  static const TestPki& Get() {
    static const TestPki* const pki = new TestPki();
    return *pki;
  }
};

/// Names the parameter of tests that run for several versions of TLS.
inline std::string NameOfVersion(const testing::TestParamInfo<int>& version) {
  return version.param == TLS1_2_VERSION ? "Tls12" : "Tls13";
}

inline Ssl::SSLContextConfig TrustingConfig(const Identity& ca) {
  Ssl::SSLContextConfig config;
  config.caCertificates = {ca.ToCertificate()};
  return config;
}

inline Ref<Ssl::SSLContext> TrustingContext(const Identity& ca) {
  return Ssl::CreateSSLContext(TrustingConfig(ca));
}

/// How messages report an alert of the peer; OpenSSL's own words, in brackets, depend on its
/// version.
inline std::string SentAlert(const std::string& name, int alert) {
  const char* reason =
      ERR_reason_error_string(ERR_PACK(ERR_LIB_SSL, 0, SSL_AD_REASON_OFFSET + alert));
  EXPECT_NE(reason, nullptr) << alert;
  return "the peer sent the alert " + name + " (" + (reason == nullptr ? "" : reason) + ")";
}

/// A TLS stream over TCP to a port of the loopback interface; closed with its owner.
class TlsClient {
 public:
  TlsClient(Ssl::SSLContext& context, int port, const std::string& host = "sts.example",
            const std::string& serverName = "")
      : socket_(System::CreateTCPClientSocket(System::GetThreadPool().get())), port_(port) {
    const Outcome connected;
    socket_->ConnectAsync("127.0.0.1", port, [connected](System::TCPClientSocket*, Exception* e) {
      connected.Report(e);
    });
    EXPECT_TRUE(connected.Wait());
    EXPECT_EQ(connected.Message(), "");
    stream_ = context.WrapStream(socket_.get(), "");
    stream_->HandshakeClientAsync(host, serverName, handshake_.ForWrite());
    EXPECT_TRUE(handshake_.Wait());
  }
  ~TlsClient() { stream_->Close(); }
  TlsClient(const TlsClient&) = delete;
  TlsClient& operator=(const TlsClient&) = delete;

  /// Empty when the handshake has succeeded.
  std::string Message() const { return WithoutPort(handshake_.Message()); }
  /// `message` with "PORT" in place of the number of the port.
  std::string WithoutPort(std::string message) const {
    const std::string port = ":" + std::to_string(port_);
    const auto found = message.find(port);
    return found == std::string::npos ? message : message.replace(found, port.size(), ":PORT");
  }
  const Outcome& Handshake() const { return handshake_; }
  Ssl::SSLStream& Stream() const { return *stream_; }

 private:
  Ref<System::TCPClientSocket> socket_;
  Ref<Ssl::SSLStream> stream_;
  Outcome handshake_;
  int port_;
};

}  // namespace Tarnik::Testing

#endif
