#include "support/peer.h"

#include <array>
#include <cerrno>
#include <memory>
#include <stdexcept>

#include <arpa/inet.h>
#include <fcntl.h>
#include <netinet/in.h>
#include <openssl/pem.h>
#include <openssl/ssl.h>
#include <poll.h>
#include <signal.h>
#include <sys/socket.h>
#include <unistd.h>

namespace SsoClient::Tool::Testing {
namespace {

constexpr std::size_t kBufferSize = 4096;

void Require(bool isDone, const char* what) {
  if (!isDone) {
    throw std::runtime_error(what);
  }
}

sockaddr_in AddressOf(int socket) {
  sockaddr_in address{};
  socklen_t size = sizeof address;
  Require(getsockname(socket, reinterpret_cast<sockaddr*>(&address), &size) == 0, "getsockname");
  return address;
}

void ReadUntilEnd(int descriptor) {
  std::array<char, kBufferSize> buffer{};
  while (recv(descriptor, buffer.data(), buffer.size(), 0) > 0) {
  }
}

struct FreeBio {
  void operator()(BIO* bio) const { BIO_free(bio); }
};
using OwnedBio = std::unique_ptr<BIO, FreeBio>;

OwnedBio Memory(const std::string& text) {
  return OwnedBio(BIO_new_mem_buf(text.data(), static_cast<int>(text.size())));
}

std::shared_ptr<SSL_CTX> MakeContext(const std::string& certificate, const std::string& key) {
  std::shared_ptr<SSL_CTX> context(SSL_CTX_new(TLS_server_method()), SSL_CTX_free);
  const std::shared_ptr<X509> own(
      PEM_read_bio_X509(Memory(certificate).get(), nullptr, nullptr, nullptr), X509_free);
  const std::shared_ptr<EVP_PKEY> secret(
      PEM_read_bio_PrivateKey(Memory(key).get(), nullptr, nullptr, nullptr), EVP_PKEY_free);
  SSL_CTX_set_mode(context.get(), SSL_MODE_NO_AUTO_CHAIN);
  Require(SSL_CTX_use_certificate(context.get(), own.get()) == 1 &&
              SSL_CTX_use_PrivateKey(context.get(), secret.get()) == 1,
          "certificate");
  return context;
}

void AddChain(SSL_CTX* context, const std::string& chain) {
  const OwnedBio bio = Memory(chain);
  while (X509* each = PEM_read_bio_X509(bio.get(), nullptr, nullptr, nullptr)) {
    Require(SSL_CTX_add0_chain_cert(context, each) == 1, "chain");
  }
}

}  // namespace

ListeningSocket::ListeningSocket(int backlog)
    : number_(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  Require(bind(number_, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0 &&
              listen(number_, backlog) == 0,
          "cannot listen");
}

ListeningSocket::~ListeningSocket() {
  close(number_);
}

int ListeningSocket::Port() const {
  return ntohs(AddressOf(number_).sin_port);
}

std::string ListeningSocket::Url() const {
  return "https://127.0.0.1:" + std::to_string(Port()) + "/sts";
}

Blackhole::Blackhole() : socket_(0) {
  const sockaddr_in address = AddressOf(socket_.Number());
  for (bool isFull = false; !isFull;) {
    const int client = socket(AF_INET, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0);
    clients_.push_back(client);
    connect(client, reinterpret_cast<const sockaddr*>(&address), sizeof address);
    // On loopback, a connection that the queue has room for is made at once.
    pollfd polled{client, POLLOUT, 0};
    isFull = poll(&polled, 1, 100) == 0;
  }
}

Blackhole::~Blackhole() {
  for (const int client : clients_) {
    close(client);
  }
}

Peer::Peer(Serve serve) : socket_(16), serve_(std::move(serve)) {
  Require(pipe2(stop_, O_CLOEXEC) == 0, "cannot open a pipe");
  thread_ = std::thread([this] { Run(); });
}

Peer::~Peer() {
  close(stop_[1]);
  thread_.join();
  close(stop_[0]);
}

void Peer::StopListening() const {
  shutdown(socket_.Number(), SHUT_RDWR);
}

void Peer::Run() {
  for (;;) {
    pollfd polled[] = {{socket_.Number(), POLLIN, 0}, {stop_[0], POLLIN, 0}};
    if (poll(polled, 2, -1) < 0 || polled[1].revents != 0) {
      return;
    }
    const int descriptor = accept4(socket_.Number(), nullptr, nullptr, SOCK_CLOEXEC);
    if (descriptor >= 0) {
      serve_(descriptor);
      close(descriptor);
    } else if (errno == EINVAL) {
      return;  // nobody listens any more
    }
  }
}

Peer::Serve Answering(const std::string& answer) {
  return [answer](int descriptor) {
    std::array<char, kBufferSize> buffer{};
    if (recv(descriptor, buffer.data(), buffer.size(), 0) > 0) {
      send(descriptor, answer.data(), answer.size(), MSG_NOSIGNAL);
    }
  };
}

Peer::Serve Greeting(const std::string& banner) {
  return [banner](int descriptor) {
    send(descriptor, banner.data(), banner.size(), MSG_NOSIGNAL);
    ReadUntilEnd(descriptor);
  };
}

Peer::Serve Silent() {
  return ReadUntilEnd;
}

Peer::Serve TlsPeer(const std::string& certificate, const std::string& key,
                    const std::string& chain, const std::string& ciphers) {
  signal(SIGPIPE, SIG_IGN);  // OpenSSL writes also to connections that the tool has closed
  const std::shared_ptr<SSL_CTX> context = MakeContext(certificate, key);
  AddChain(context.get(), chain);
  if (!ciphers.empty()) {
    Require(SSL_CTX_set_max_proto_version(context.get(), TLS1_2_VERSION) == 1 &&
                SSL_CTX_set_cipher_list(context.get(), ciphers.c_str()) == 1,
            "cipher suites");
  }
  return [context](int descriptor) {
    const std::shared_ptr<SSL> ssl(SSL_new(context.get()), SSL_free);
    SSL_set_fd(ssl.get(), descriptor);
    if (SSL_accept(ssl.get()) == 1) {
      ReadUntilEnd(descriptor);
    }
  };
}

}  // namespace SsoClient::Tool::Testing
