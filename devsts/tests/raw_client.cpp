#include "raw_client.h"

#include <array>
#include <cerrno>
#include <stdexcept>

#include <arpa/inet.h>
#include <openssl/err.h>
#include <openssl/pem.h>
#include <openssl/x509v3.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

namespace DevSts::Testing {
namespace {

int Connect(std::uint16_t port, const std::string& address) {
  sockaddr_storage storage{};
  socklen_t size = 0;
  if (address.find(':') != std::string::npos) {
    auto* target = reinterpret_cast<sockaddr_in6*>(&storage);
    target->sin6_family = AF_INET6;
    target->sin6_port = htons(port);
    inet_pton(AF_INET6, address.c_str(), &target->sin6_addr);
    size = sizeof *target;
  } else {
    auto* target = reinterpret_cast<sockaddr_in*>(&storage);
    target->sin_family = AF_INET;
    target->sin_port = htons(port);
    inet_pton(AF_INET, address.c_str(), &target->sin_addr);
    size = sizeof *target;
  }
  const int made = socket(storage.ss_family, SOCK_STREAM | SOCK_CLOEXEC, 0);
  if (made < 0 || connect(made, reinterpret_cast<sockaddr*>(&storage), size) != 0) {
    throw std::runtime_error("cannot connect");
  }
  const timeval limit{20, 0};  // so that no test hangs if the server does not answer
  setsockopt(made, SOL_SOCKET, SO_RCVTIMEO, &limit, sizeof limit);
  return made;
}

std::shared_ptr<BIO> ReadFrom(const std::string& pem) {
  return {BIO_new_mem_buf(pem.data(), static_cast<int>(pem.size())), BIO_free_all};
}

std::shared_ptr<X509> CertificateFrom(const std::string& pem) {
  return {PEM_read_bio_X509(ReadFrom(pem).get(), nullptr, nullptr, nullptr), X509_free};
}

bool IsComplete(const std::string& text) {
  const std::size_t end = text.find("\r\n\r\n");
  if (end == std::string::npos) {
    return false;
  }
  const std::size_t length = text.find("Content-Length: ");
  if (length != std::string::npos && length < end) {
    return text.size() >= end + 4 + std::stoul(text.substr(length + 16));
  }
  return text.find("Transfer-Encoding: chunked") < end &&
         text.find("0\r\n\r\n", end) != std::string::npos;
}

}  // namespace

RawClient::RawClient(std::uint16_t port, const std::string& address)
    : socket_(Connect(port, address)) {}

RawClient::~RawClient() {
  close(socket_);
}

void RawClient::UseClientCredential(const std::string& certificatePem, const std::string& keyPem) {
  clientCertificate_ = certificatePem;
  clientKey_ = keyPem;
}

long RawClient::StartTls(const std::string& caPem, SSL_SESSION* resume, const std::string& host) {
  context_ = {SSL_CTX_new(TLS_client_method()), SSL_CTX_free};
  SSL_CTX_set_min_proto_version(context_.get(), TLS1_2_VERSION);
  X509_STORE_add_cert(SSL_CTX_get_cert_store(context_.get()), CertificateFrom(caPem).get());
  SSL_CTX_set_verify(context_.get(), SSL_VERIFY_PEER, nullptr);
  if (!clientCertificate_.empty()) {
    const std::shared_ptr<EVP_PKEY> key(
        PEM_read_bio_PrivateKey(ReadFrom(clientKey_).get(), nullptr, nullptr, nullptr),
        EVP_PKEY_free);
    SSL_CTX_use_certificate(context_.get(), CertificateFrom(clientCertificate_).get());
    SSL_CTX_use_PrivateKey(context_.get(), key.get());
  }
  tls_ = {SSL_new(context_.get()), SSL_free};
  X509_VERIFY_PARAM* parameters = SSL_get0_param(tls_.get());
  if (X509_VERIFY_PARAM_set1_ip_asc(parameters, host.c_str()) != 1) {
    X509_VERIFY_PARAM_set1_host(parameters, host.data(), host.size());
    X509_VERIFY_PARAM_set_hostflags(parameters, X509_CHECK_FLAG_NEVER_CHECK_SUBJECT);
    SSL_ctrl(tls_.get(), SSL_CTRL_SET_TLSEXT_HOSTNAME, TLSEXT_NAMETYPE_host_name,
             const_cast<char*>(host.c_str()));
  }
  if (resume != nullptr) {
    SSL_set_session(tls_.get(), resume);
  }
  SSL_set_fd(tls_.get(), socket_);
  if (SSL_connect(tls_.get()) == 1) {
    return X509_V_OK;
  }
  ERR_clear_error();
  const long result = SSL_get_verify_result(tls_.get());
  return result != X509_V_OK ? result : -1;
}

void RawClient::Send(std::string_view octets) {
  const long sent = tls_ ? SSL_write(tls_.get(), octets.data(), static_cast<int>(octets.size()))
                         : send(socket_, octets.data(), octets.size(), MSG_NOSIGNAL);
  ERR_clear_error();
  if (sent != static_cast<long>(octets.size())) {
    throw std::runtime_error("cannot send");
  }
}

bool RawClient::ReadSome(std::string& text) {
  std::array<char, 16 * 1024> octets{};
  errno = 0;
  const long received = tls_ ? SSL_read(tls_.get(), octets.data(), static_cast<int>(octets.size()))
                             : recv(socket_, octets.data(), octets.size(), 0);
  if (received > 0) {
    text.append(octets.data(), static_cast<std::size_t>(received));
    return true;
  }
  const int systemError = errno;
  ERR_clear_error();
  if (systemError == EAGAIN) {
    throw std::runtime_error("the server did not answer");
  }
  if (systemError == ECONNRESET || systemError == EPIPE) {
    ending_ = Ending::Reset;
  } else if (tls_ && (SSL_get_shutdown(tls_.get()) & SSL_RECEIVED_SHUTDOWN) == 0) {
    ending_ = Ending::Truncated;
  } else {
    ending_ = Ending::Orderly;
  }
  return false;
}

std::string RawClient::ReadAnswer() {
  std::string text;
  while (!IsComplete(text) && ReadSome(text)) {
  }
  return text;
}

std::string RawClient::ReadToEnd() {
  std::string text;
  while (ReadSome(text)) {
  }
  return text;
}

bool RawClient::IsSilent(std::chrono::milliseconds time) const {
  pollfd entry{socket_, POLLIN, 0};
  return poll(&entry, 1, static_cast<int>(time.count())) == 0;
}

std::string PostOf(const std::string& envelope, const std::string& action) {
  return "POST /sts HTTP/1.1\r\nHost: localhost\r\nContent-Type: text/xml\r\nSOAPAction: \"" +
         action + "\"\r\nContent-Length: " + std::to_string(envelope.size()) + "\r\n\r\n" +
         envelope;
}

}  // namespace DevSts::Testing
