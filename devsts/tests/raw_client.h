#ifndef DEVSTS_RAW_CLIENT_H
#define DEVSTS_RAW_CLIENT_H

#include <openssl/ssl.h>
#include <openssl/x509_vfy.h>

#include <chrono>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

namespace DevSts::Testing {

// How the server ended what a client read.
enum class Ending { Open, Orderly, Truncated, Reset };

// A client that sends and receives octets, for looking at what the server does on the wire.
class RawClient {
 public:
  explicit RawClient(std::uint16_t port, const std::string& address = "127.0.0.1");
  ~RawClient();
  RawClient(const RawClient&) = delete;
  RawClient& operator=(const RawClient&) = delete;

  // Trusts nothing but `caPem`, and checks the address. OpenSSL's verification result if the
  // handshake fails for it, -1 for any other failure, X509_V_OK if it succeeds.
  long StartTls(const std::string& caPem, SSL_SESSION* resume = nullptr,
                const std::string& host = "127.0.0.1");
  void UseClientCredential(const std::string& certificatePem, const std::string& keyPem);

  void Send(std::string_view octets);
  // Reads until the text ends in an answer of Content-Length or chunks, or the server ends it.
  std::string ReadAnswer();
  // Reads until the server ends the connection.
  std::string ReadToEnd();
  // Appends what arrives next; false at the end.
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

// A POST of the envelope as the service wants it.
std::string PostOf(const std::string& envelope, const std::string& action);

}  // namespace DevSts::Testing

#endif
