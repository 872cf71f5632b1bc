// The lines of an input describe a connection spec: whether it can be made, how it shows itself,
// and, for a peer on this machine, how its connects end. The lines are:
//   host TEXT, port TEXT, server-name TEXT
//   tls [null]            TLS, without a context
//   trusts root|other     whom the context trusts
//   server direct|closes|silent    what the peer presents, or does after it has accepted
#include <cstdlib>
#include <memory>
#include <string>

#include <arpa/inet.h>
#include <openssl/err.h>
#include <openssl/ssl.h>
#include <strings.h>
#include <sys/socket.h>
#include <unistd.h>

#include <tarnik/core/exception.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/http/connection_specs.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/ssl/ssl_exception.h>

#include "client_pki.h"
#include "fixed_random.h"
#include "host_model.h"
#include "input.h"
#include "single_thread.h"
#include "words.h"

namespace {

using namespace Tarnik;

constexpr const char* kLoopback = "127.0.0.1";

struct Plan {
  std::string host = kLoopback;
  std::string port = "443";
  std::string serverName;
  bool isTls = false;
  bool hasContext = true;
  std::string trusted = "root";
  std::string server = "direct";

  explicit Plan(std::string_view input) {
    for (const Fuzz::Words& line : Fuzz::LinesOfWords(input)) {
      Take(line.front(), line.size() > 1 ? line[1] : "");
    }
  }

  /// The number that the port's text begins with, as a caller may have read it.
  int Port() const { return static_cast<int>(std::strtol(port.substr(0, 8).c_str(), nullptr, 10)); }
  bool IsSound() const {
    const bool isNamed = serverName.empty() || Fuzz::IsHostToCall(serverName);
    return Fuzz::IsHostToCall(host) && Port() >= 1 && Port() <= 65535 &&
           (!isTls || (hasContext && isNamed));
  }
  Ref<Ssl::SSLContext> Context() const {
    if (!hasContext) {
      return nullptr;
    }
    Ssl::SSLContextConfig config;
    config.caCertificates = {Fuzz::FindCertificate(trusted)->identity.ToCertificate()};
    return Ssl::CreateSSLContext(config);
  }

 private:
  void Take(const std::string& kind, const std::string& value) {
    if (kind == "host") {
      host = value;
    } else if (kind == "port") {
      port = value;
    } else if (kind == "server-name") {
      serverName = value;
    } else if (kind == "tls") {
      isTls = true;
      hasContext = value != "null";
    } else if (kind == "trusts") {
      trusted = value == "other" ? "other" : "root";
    } else if (kind == "server") {
      server = value;
    }
  }
};

Ref<Http::ConnectionSpec> SpecOf(const Plan& plan, int port) {
  return plan.isTls
             ? Http::CreateTLSConnectionSpec(plan.host, port, plan.Context().get(), plan.serverName)
             : Http::CreateTCPConnectionSpec(plan.host, port);
}

// A peer.

class Descriptor {
 public:
  explicit Descriptor(int value) : value_(value) {}
  ~Descriptor() { Close(); }
  Descriptor(const Descriptor&) = delete;
  Descriptor& operator=(const Descriptor&) = delete;

  int Get() const { return value_; }
  bool IsOpen() const { return value_ >= 0; }
  void Set(int value) { value_ = value; }
  void Close() {
    if (value_ >= 0) {
      close(value_);
    }
    value_ = -1;
  }

 private:
  int value_;
};

/// A TLS server on this machine with one connection. It works only while it is driven.
class LoopbackServer {
 public:
  explicit LoopbackServer(const Plan& plan)
      : plan_(plan), listener_(socket(AF_INET, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0)) {
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    auto* generic = reinterpret_cast<sockaddr*>(&address);
    socklen_t length = sizeof(address);
    Fuzz::Require(bind(listener_.Get(), generic, length) == 0 && listen(listener_.Get(), 1) == 0 &&
                  getsockname(listener_.Get(), generic, &length) == 0);
    port_ = ntohs(address.sin_port);
    const auto& own = Fuzz::FindCertificate("direct")->identity;
    Fuzz::Require(SSL_CTX_use_certificate(context_.get(), own.certificate.get()) == 1 &&
                  SSL_CTX_use_PrivateKey(context_.get(), own.key.get()) == 1);
  }

  int Port() const { return port_; }
  /// The name that the client has asked for; empty if none.
  std::string ServerName() const {
    const char* name =
        ssl_ == nullptr ? nullptr : SSL_get_servername(ssl_.get(), TLSEXT_NAMETYPE_host_name);
    return name == nullptr ? "" : name;
  }
  bool HasHeard() const { return hasHeard_; }

  void Drive() {
    if (!connection_.IsOpen()) {
      Accept();
      return;
    }
    char byte = 0;
    hasHeard_ = hasHeard_ || recv(connection_.Get(), &byte, 1, MSG_PEEK) > 0;
    if (hasHeard_ && plan_.server == "closes") {
      // The beginning of a record, so that its end is missed.
      const char beginning[] = {22, 3, 3};
      hasClosed_ =
          hasClosed_ || send(connection_.Get(), beginning, sizeof(beginning), MSG_NOSIGNAL) > 0;
      shutdown(connection_.Get(), SHUT_WR);
    } else if (hasHeard_ && plan_.server != "silent") {
      SSL_accept(ssl_.get());
      ERR_clear_error();
    }
  }

 private:
  void Accept() {
    connection_.Set(accept4(listener_.Get(), nullptr, nullptr, SOCK_NONBLOCK | SOCK_CLOEXEC));
    if (connection_.IsOpen()) {
      ssl_.reset(SSL_new(context_.get()));
      Fuzz::Require(SSL_set_fd(ssl_.get(), connection_.Get()) == 1);
    }
  }

  const Plan& plan_;
  OpenSsl::OwnedSslContext context_{SSL_CTX_new(TLS_server_method())};
  Descriptor listener_;
  int port_ = 0;
  Descriptor connection_{-1};
  OpenSsl::OwnedSsl ssl_;
  bool hasHeard_ = false;
  bool hasClosed_ = false;
};

/// The end of a connect.
struct Outcome {
  int count = 0;
  Ref<System::Stream> stream;
  std::string failure;
  bool isTrustFailure = false;
  bool isNameFailure = false;
  bool isCancelled = false;

  void Report(System::Stream* opened, const Exception* error) {
    Fuzz::Require(++count == 1 && (opened != nullptr || error != nullptr));
    stream = Ref<System::Stream>(opened);
    failure = error == nullptr ? "" : error->Message();
    isTrustFailure = dynamic_cast<const Ssl::PeerTrustException*>(error) != nullptr;
    isNameFailure = dynamic_cast<const Ssl::PeerNameException*>(error) != nullptr;
    isCancelled = dynamic_cast<const CancelledException*>(error) != nullptr;
  }
};

bool IsCertified(const std::string& name) {
  const std::string bytes = Fuzz::AddressBytes(name);
  const std::string bare = name.ends_with('.') ? name.substr(0, name.size() - 1) : name;
  return bytes.empty() ? strcasecmp(bare.c_str(), Fuzz::kServerHost) == 0
                       : bytes == Fuzz::AddressBytes(Fuzz::kServerAddress) ||
                             bytes == Fuzz::AddressBytes(Fuzz::kServerLongAddress);
}

void RequireEnd(const Plan& plan, const LoopbackServer& server, const Outcome& outcome) {
  if (!plan.isTls) {
    Fuzz::Require(outcome.failure.empty());
    Fuzz::Require(dynamic_cast<Ssl::SSLStream*>(outcome.stream.get()) == nullptr);
    return;
  }
  Fuzz::Require(dynamic_cast<Ssl::SSLStream*>(outcome.stream.get()) != nullptr);
  if (plan.server == "silent") {
    Fuzz::Require(outcome.isCancelled);
    return;
  }
  const std::string beginning = std::string("TLS handshake with ") + kLoopback + ":" +
                                std::to_string(server.Port()) + " failed: ";
  if (plan.server == "closes") {
    Fuzz::Require(outcome.failure == beginning + "the peer closed the connection");
    return;
  }
  const std::string& expected = plan.serverName.empty() ? plan.host : plan.serverName;
  const bool isTrusted = plan.trusted == "root";
  const bool isNamed = IsCertified(expected);
  Fuzz::Require(outcome.failure.empty() == (isTrusted && isNamed));
  if (!outcome.failure.empty()) {
    Fuzz::Require(outcome.failure.starts_with(beginning));
    Fuzz::Require((outcome.isTrustFailure && !isTrusted) || (outcome.isNameFailure && !isNamed));
  }
  const bool isRooted = expected.ends_with('.');
  const std::string bare = isRooted ? expected.substr(0, expected.size() - 1) : expected;
  Fuzz::Require(server.ServerName() == (Fuzz::AddressBytes(expected).empty() ? bare : ""));
}

void Connect(const Plan& plan) {
  LoopbackServer server(plan);
  const auto spec = SpecOf(plan, server.Port());
  auto* custom = dynamic_cast<Http::CustomConnectionSpec*>(spec.get());
  Outcome outcome;
  const auto item = custom->StartConnect(
      [&](System::Stream* stream, const Exception* error) { outcome.Report(stream, error); });
  while (outcome.count == 0) {
    Fuzz::RunCompletions();
    server.Drive();
    if (plan.isTls && plan.server == "silent" && server.HasHeard()) {
      item->Cancel();
    }
  }
  RequireEnd(plan, server, outcome);
  outcome.stream->Close();
  while (Fuzz::RunCompletions()) {
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  Fuzz::RunOnOneThread();
  const Plan plan(Fuzz::TextOf(data, size));
  Fuzz::FindCertificate("root");
  Fuzz::FixRandomness(size);
  Ref<Http::ConnectionSpec> spec;
  try {
    spec = SpecOf(plan, plan.Port());
  } catch (const InvalidArgumentException&) {
    Fuzz::Require(!plan.IsSound());
    return 0;
  }
  Fuzz::Require(plan.IsSound());
  auto* custom = dynamic_cast<Http::CustomConnectionSpec*>(spec.get());
  const bool isLong = plan.host.find(':') != std::string::npos;
  const std::string key =
      (isLong ? "[" + plan.host + "]" : plan.host) + ":" + std::to_string(plan.Port());
  Fuzz::Require(custom != nullptr && custom->Host() == plan.host &&
                custom->CookieHost() == plan.host && custom->EndpointKey() == key);
  Fuzz::Require(!custom->IsProxy());
  Fuzz::Require(spec->ToString() ==
                (plan.isTls ? "<TLSConnectionSpec:" : "<TCPConnectionSpec:") + key + ">");
  // Other hosts could be on a network.
  if (plan.host == kLoopback) {
    Connect(plan);
  }
  return 0;
}
