#include "devsts/server.h"

#include <iostream>
#include <memory>
#include <mutex>
#include <utility>

#include "operations/service.h"
#include "wire/connection_threads.h"
#include "wire/conversation.h"
#include "wire/listener.h"
#include "wire/misbehavior_plan.h"
#include "wire/observation.h"
#include "wire/tls_context.h"

namespace DevSts {

// What connections over TLS use.
struct TlsIdentity {
  ServerIdentity identity;
  std::shared_ptr<SSL_CTX> context;
};

namespace {

bool IsGiven(const Credential& credential) {
  return !credential.certificatePem.empty();
}

Credential AuthorityOf(const ServerOptions& options) {
  if (IsGiven(options.keys.authority)) {
    return options.keys.authority;
  }
  CertificateSpec spec;
  spec.notAfter = kCertificateLifetime;
  spec.commonName = "Dev STS CA";
  spec.isAuthority = true;
  spec.freshKey = true;  // clients of one server do not trust another's certificate
  return MakeCertificate(spec);
}

Credential MakeSigner(KeyType keyType, bool freshKey) {
  CertificateSpec spec;
  spec.notAfter = kCertificateLifetime;
  spec.commonName = "Dev STS signing";
  spec.keyType = keyType;
  spec.freshKey = freshKey;
  return MakeCertificate(spec);
}

Credential SignerOf(const ServerOptions& options) {
  return IsGiven(options.keys.signing) ? options.keys.signing
                                       : MakeSigner(options.assertion.signingKey, false);
}

TlsIdentity MakeTlsIdentity(const TlsOptions& options, const ServerKeys& keys,
                            const Credential& authority) {
  TlsIdentity made;
  if (options.certificate == ServerCertificate::Valid && IsGiven(keys.server)) {
    made.identity.credential = keys.server;
  } else {
    made.identity = MakeServerIdentity(options, authority);
  }
  made.context = MakeTlsContext(options, made.identity, authority);
  return made;
}

std::string Bracketed(const std::string& address) {
  return address.find(':') != std::string::npos ? "[" + address + "]" : address;
}

std::string Url(const char* scheme, const std::string& host, std::uint16_t port,
                const std::string& path) {
  return std::string(scheme) + "://" + host + ":" + std::to_string(port) + path;
}

}  // namespace

class Server::Impl {
 public:
  explicit Impl(ServerOptions serverOptions)
      : options(std::move(serverOptions)),
        authority(AuthorityOf(options)),
        signing(SignerOf(options)),
        tls(MakeTlsIdentity(options.tls, options.keys, authority)),
        service(options, signing),
        observation(options.requestLogLimit),
        httpListener(Open(false)),
        httpsListener(Open(true)) {}

  ~Impl() { threads.Stop(); }

  Listener Open(bool overTls) {
    try {
      return Listener(
          options.address, overTls ? options.httpsPort : options.httpPort,
          [this, overTls](int socket) { Take(socket, overTls ? Tls().context.get() : nullptr); },
          [this](const std::string& message) { Report(message); });
    } catch (const std::system_error& error) {
      throw PortError(error.code(), overTls);
    }
  }

  TlsIdentity Tls() const {
    const std::lock_guard lock(tlsMutex);
    return tls;
  }

  void SetTls(const TlsOptions& tlsOptions) {
    TlsIdentity made = MakeTlsIdentity(tlsOptions, options.keys, authority);
    const std::lock_guard lock(tlsMutex);
    tls = std::move(made);
  }

  void Take(int socket, SSL_CTX* context) {
    observation.Count([](Counters& counters) {
      ++counters.connectionsAccepted;
      ++counters.connectionsOpen;
    });
    const auto closed = [this] {
      observation.Count([](Counters& counters) { --counters.connectionsOpen; });
    };
    const auto serve = [this](Connection& connection, std::uint64_t id) {
      Conversation(connection, id, {service, plan, observation, options.onRequest}).Run();
    };
    threads.Start(socket, context, serve, closed);
  }

  void Report(const std::string& failure) const {
    if (options.onFailure) {
      options.onFailure(failure);
    } else {
      std::cerr << "dev STS: " + failure + "\n";
    }
  }

  const ServerOptions options;
  const Credential authority;
  const Credential signing;
  mutable std::mutex tlsMutex;
  TlsIdentity tls;
  Service service;
  MisbehaviorPlan plan;
  Observation observation;
  ConnectionThreads threads;
  // Declared last, so that connections are accepted only while the other members exist.
  Listener httpListener;
  Listener httpsListener;
};

Server::Server(ServerOptions options) : impl_(std::make_unique<Impl>(std::move(options))) {}

Server::~Server() = default;

std::uint16_t Server::HttpPort() const {
  return impl_->httpListener.Port();
}

std::uint16_t Server::HttpsPort() const {
  return impl_->httpsListener.Port();
}

std::string Server::HttpUrl(const std::string& path) const {
  return Url("http", Bracketed(impl_->options.address), HttpPort(), path);
}

std::string Server::HttpsUrl(const std::string& path) const {
  return HttpsUrlFor(Bracketed(impl_->options.address), path);
}

std::string Server::HttpsUrlFor(const std::string& host, const std::string& path) const {
  return Url("https", host, HttpsPort(), path);
}

std::string Server::CaCertificatePem() const {
  return impl_->authority.certificatePem;
}

std::string Server::ServerCertificatePem() const {
  return impl_->Tls().identity.credential.certificatePem;
}

std::string Server::SigningCertificatePem() const {
  return impl_->signing.certificatePem;
}

Credential Server::SigningCredential() const {
  return impl_->signing;
}

Credential Server::StrangerCredential() const {
  static const Credential stranger = MakeSigner(KeyType::Rsa2048, true);
  return stranger;
}

Credential Server::MakeClientCredential(const std::string& commonName) const {
  CertificateSpec spec;
  spec.notAfter = kCertificateLifetime;
  spec.commonName = commonName;
  spec.keyType = KeyType::Rsa2048;
  return MakeCertificate(spec, &impl_->authority);
}

void Server::SetUsers(Users users) {
  impl_->service.SetUsers(std::move(users));
}

void Server::RegisterCertificate(const std::string& userName, const std::string& certificatePem) {
  impl_->service.RegisterCertificate(userName, certificatePem);
}

bool Server::Revoke(const std::string& assertionId) {
  return impl_->service.Revoke(assertionId);
}

void Server::SetAssertionOptions(AssertionOptions options) {
  impl_->service.SetAssertionOptions(std::move(options));
}

void Server::SetTlsOptions(const TlsOptions& options) {
  impl_->SetTls(options);
}

void Server::SetNegotiationScript(NegotiationScript script) {
  impl_->service.SetNegotiationScript(std::move(script));
}

std::size_t Server::OpenNegotiations() const {
  return impl_->service.OpenNegotiations();
}

void Server::SetMisbehavior(Misbehavior misbehavior) {
  impl_->plan.Set(std::move(misbehavior));
}

void Server::ClearMisbehavior() {
  impl_->plan.Clear();
}

void Server::MisbehaveNext(Misbehavior misbehavior, std::size_t count) {
  impl_->plan.Next(std::move(misbehavior), count);
}

std::vector<ReceivedRequest> Server::Requests() const {
  return impl_->observation.Requests();
}

ReceivedRequest Server::LastRequest() const {
  return impl_->observation.LastRequest();
}

void Server::ClearRequests() {
  impl_->observation.ClearRequests();
}

Counters Server::GetCounters() const {
  return impl_->observation.GetCounters();
}

bool Server::WaitUntil(const std::function<bool(const Counters&)>& condition,
                       std::chrono::milliseconds timeout) const {
  return impl_->observation.WaitUntil(condition, timeout);
}

}  // namespace DevSts
