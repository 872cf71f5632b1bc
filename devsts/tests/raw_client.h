#ifndef DEVSTS_RAW_CLIENT_H
#define DEVSTS_RAW_CLIENT_H

#include <chrono>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include <openssl/ssl.h>
#include <openssl/x509_vfy.h>

namespace DevSts::Testing {

// How the server ended the connection.
enum class Ending { Open, Orderly, Truncated, Reset };

// A client that sends and receives octets, for tests of the server's behaviour on the wire.
class RawClient {
 public:
  explicit RawClient(std::uint16_t port, const std::string& address = "127.0.0.1");
  ~RawClient();
  RawClient(const RawClient&) = delete;
  RawClient& operator=(const RawClient&) = delete;

  // Trusts only `caPem` and checks the host. Returns X509_V_OK on success, OpenSSL's verification
  // result if that is why the handshake failed, -1 for any other failure.
  long StartTls(const std::string& caPem, SSL_SESSION* resume = nullptr,
                const std::string& host = "127.0.0.1");
  void UseClientCredential(const std::string& certificatePem, const std::string& keyPem);

  void Send(std::string_view octets);
  // Reads until the text is a complete answer, by Content-Length or chunks, or the server ends the
  // connection.
  std::string ReadAnswer();
  // Reads until the server ends the connection.
  std::string ReadToEnd();
  // Appends what arrives next; returns false at the end.
  bool ReadSome(std::string& text);
  // Whether nothing arrives for this long.
  bool IsSilent(std::chrono::milliseconds time) const;

  Ending HowItEnded() const { return ending_; }
  SSL* Tls() const { return tls_.get(); }

 private:
  int socket_;
  std::shared_ptr<SSL_CTX> context_;
  std::shared_ptr<SSL> tls_;
  std::string clientCertificate_;
  std::string clientKey_;
  Ending ending_ = Ending::Open;
};

// A POST request with the envelope as the service expects it.
std::string PostOf(const std::string& envelope, const std::string& action);

}  // namespace DevSts::Testing

#endif
