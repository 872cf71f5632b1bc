#include <string>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/http/connection_specs.h>
#include <tarnik/system/tcp_client_socket.h>
#include <tarnik/system/thread_pool.h>

#include "system/host_name.h"

namespace Tarnik::Http {
namespace {

using ConnectCompletion = CustomConnectionSpec::ConnectCompletion;
using System::TCPClientSocket;

bool IsNameOrAddress(const std::string& host) {
  return System::IsDnsName(host) || System::IsIPv4Address(host) || System::IsIPv6Address(host);
}

void RequireEndpoint(const std::string& host, int port) {
  if (!IsNameOrAddress(host)) {
    throw InvalidArgumentException("The host to connect to is neither a name nor an address.");
  }
  if (port < 1 || port > 65535) {
    throw InvalidArgumentException("The port " + std::to_string(port) + " is not 1 to 65535.");
  }
}

class TcpConnectionSpec : public CustomConnectionSpec, public ObjectImpl {
 public:
  TcpConnectionSpec(std::string host, int port)
      : host_(std::move(host)), port_(port), endpoint_(System::DescribeEndpoint(host_, port)) {}

  std::string Host() const override { return host_; }
  std::string CookieHost() const override { return host_; }
  std::string EndpointKey() const override { return endpoint_; }
  bool IsProxy() const override { return false; }
  std::string ToString() const override { return "<TCPConnectionSpec:" + endpoint_ + ">"; }

  Ref<System::CancellableItem> StartConnect(ConnectCompletion completion) override {
    return Connect([completion = std::move(completion)](TCPClientSocket* socket, Exception* error) {
      completion(socket, error);
    });
  }

 protected:
  ~TcpConnectionSpec() override = default;

  Ref<System::CancellableItem> Connect(TCPClientSocket::ConnectCompletion completion) const {
    const auto socket = System::CreateTCPClientSocket(System::GetThreadPool().get());
    auto item = System::CreateConnectItem(socket.get());
    socket->ConnectAsync(host_, port_, std::move(completion));
    return item;
  }

 private:
  const std::string host_;
  const int port_;
  const std::string endpoint_;
};

class TlsConnectionSpec final : public TcpConnectionSpec {
 public:
  TlsConnectionSpec(const std::string& host, int port, Ssl::SSLContext* sslContext,
                    std::string serverName)
      : TcpConnectionSpec(host, port),
        sslContext_(sslContext),
        serverName_(std::move(serverName)) {}

  std::string ToString() const override { return "<TLSConnectionSpec:" + EndpointKey() + ">"; }

  Ref<System::CancellableItem> StartConnect(ConnectCompletion completion) override {
    return Connect([self = Ref<const TlsConnectionSpec>(this), completion = std::move(completion)](
                       TCPClientSocket* socket, Exception* error) {
      if (error != nullptr) {
        completion(socket, error);
        return;
      }
      self->StartHandshake(socket, completion);
    });
  }

 private:
  ~TlsConnectionSpec() override = default;

  static System::Stream* AsStream(System::Stream* socket) { return socket; }

  // Runs on an I/O thread, which no exception may leave.
  void StartHandshake(TCPClientSocket* socket, const ConnectCompletion& completion) const {
    Ref<Ssl::SSLStream> stream;
    try {
      stream = sslContext_->WrapStream(socket, "");
      stream->HandshakeClientAsync(Host(), serverName_, [completion, stream](Exception* error) {
        completion(stream.get(), error);
      });
    } catch (Exception& refusal) {
      completion(stream == nullptr ? AsStream(socket) : stream.get(), &refusal);
    } catch (const std::bad_alloc&) {
      ResourceException failure(OutOfMemory());
      completion(stream == nullptr ? AsStream(socket) : stream.get(), &failure);
    }
  }

  const Ref<Ssl::SSLContext> sslContext_;
  const std::string serverName_;
};

}  // namespace

Ref<ConnectionSpec> CreateTCPConnectionSpec(const std::string& host, int port) {
  RequireEndpoint(host, port);
  return MakeRef<TcpConnectionSpec>(host, port);
}

Ref<ConnectionSpec> CreateTLSConnectionSpec(const std::string& host, int port,
                                            Ssl::SSLContext* sslContext,
                                            const std::string& serverName) {
  RequireEndpoint(host, port);
  if (sslContext == nullptr) {
    throw InvalidArgumentException("A spec of TLS connections needs an SSL context.");
  }
  if (!serverName.empty() && !IsNameOrAddress(serverName)) {
    throw InvalidArgumentException("The name of the TLS server is neither a name nor an address.");
  }
  return MakeRef<TlsConnectionSpec>(host, port, sslContext, serverName);
}

}  // namespace Tarnik::Http
