#include "transport/sso_connection_specs.h"

#include <new>
#include <utility>

#include <tarnik/system/tcp_client_socket.h>
#include <tarnik/system/thread_pool.h>
#include <tarnik/text/print.h>

namespace SsoClient {

namespace {

using ConnectCompletion = Tarnik::Http::CustomConnectionSpec::ConnectCompletion;
using Tarnik::System::TCPClientSocket;

// Where a source of replacement hosts plugs in. No source exists yet.
std::string FindReplacementHost() {
  return {};
}

TCPClientSocket::ConnectCompletion AsSocketCompletion(ConnectCompletion completion) {
  if (!completion) {
    return nullptr;
  }
  return [completion = std::move(completion)](TCPClientSocket* socket, Tarnik::Exception* error) {
    completion(socket, error);
  };
}

void StartSslHandshake(const std::string& host, Tarnik::Ssl::SSLContext* sslContext,
                       const std::string& serverName, const ConnectCompletion& completion,
                       Tarnik::System::Stream* stream, Tarnik::Exception* error) {
  if (error != nullptr) {
    completion(stream, error);
    return;
  }
  Tarnik::Ref<Tarnik::Ssl::SSLStream> sslStream;
  try {
    sslStream = sslContext->WrapStream(stream, "");
    sslStream->HandshakeClientAsync(host, serverName,
                                    [completion, sslStream](Tarnik::Exception* handshakeError) {
                                      completion(sslStream.get(), handshakeError);
                                    });
  } catch (Tarnik::Exception& refusal) {
    // For instance an invalid server name. If the exception propagated, it would end the I/O
    // thread.
    completion(sslStream != nullptr ? sslStream.get() : stream, &refusal);
  } catch (const std::bad_alloc&) {
    Tarnik::ResourceException failure(Tarnik::OutOfMemory());
    completion(sslStream != nullptr ? sslStream.get() : stream, &failure);
  }
}

}  // namespace

SsoCustomConnectionSpecImpl::SsoCustomConnectionSpecImpl(std::string host, int port, bool flag)
    : host_(std::move(host)), port_(port), flag_(flag) {}

std::string SsoCustomConnectionSpecImpl::ToString() const {
  const void* address = this;
  return Tarnik::Detail::ASPrintInternal("<cs p:%1, SsoCustomConnectionSpec:%2>",
                                         {address, EndpointKey()});
}

std::string SsoCustomConnectionSpecImpl::Host() const {
  return host_;
}

std::string SsoCustomConnectionSpecImpl::CookieHost() const {
  return host_;
}

std::string SsoCustomConnectionSpecImpl::EndpointKey() const {
  return Tarnik::Detail::ASPrintInternal("%1:%2", {host_, port_});
}

bool SsoCustomConnectionSpecImpl::IsProxy() const {
  return false;
}

Tarnik::Ref<Tarnik::System::CancellableItem> SsoCustomConnectionSpecImpl::StartConnect(
    ConnectCompletion completion) {
  return StartConnectTo(ChooseHost(), std::move(completion));
}

std::string SsoCustomConnectionSpecImpl::ChooseHost() const {
  if (!flag_) {
    return host_;
  }
  std::string replacement = FindReplacementHost();
  return replacement.empty() ? host_ : replacement;
}

Tarnik::Ref<Tarnik::System::CancellableItem> SsoCustomConnectionSpecImpl::StartConnectTo(
    const std::string& host, ConnectCompletion completion) const {
  const auto socket = Tarnik::System::CreateTCPClientSocket(Tarnik::System::GetThreadPool().get());
  socket->ConnectAsync(host, port_, AsSocketCompletion(std::move(completion)));
  return Tarnik::System::CreateConnectItem(socket.get());
}

SsoCustomSslConnectionSpecImpl::SsoCustomSslConnectionSpecImpl(
    Tarnik::Ssl::SSLContext* sslContext, std::string serverName,
    Tarnik::Ref<SsoCustomConnectionSpecImpl> inner)
    : sslContext_(sslContext), serverName_(std::move(serverName)), inner_(std::move(inner)) {}

std::string SsoCustomSslConnectionSpecImpl::ToString() const {
  return inner_->ToString();
}

std::string SsoCustomSslConnectionSpecImpl::Host() const {
  return inner_->Host();
}

std::string SsoCustomSslConnectionSpecImpl::CookieHost() const {
  return inner_->CookieHost();
}

std::string SsoCustomSslConnectionSpecImpl::EndpointKey() const {
  return inner_->EndpointKey();
}

bool SsoCustomSslConnectionSpecImpl::IsProxy() const {
  return false;
}

Tarnik::Ref<Tarnik::System::CancellableItem> SsoCustomSslConnectionSpecImpl::StartConnect(
    ConnectCompletion completion) {
  const std::string host = inner_->ChooseHost();
  return inner_->StartConnectTo(
      host, [host, sslContext = sslContext_, serverName = serverName_,
             completion = std::move(completion)](Tarnik::System::Stream* stream,
                                                 Tarnik::Exception* error) {
        StartSslHandshake(host, sslContext.get(), serverName, completion, stream, error);
      });
}

void CreateSsoConnectionSpec(const std::string& host, int port, bool flag,
                             Tarnik::Ref<Tarnik::Http::ConnectionSpec>& spec) {
  spec = Tarnik::MakeRef<SsoCustomConnectionSpecImpl>(host, port, flag);
}

void CreateSsoSSLConnectionSpec(const std::string& host, int port,
                                Tarnik::Ssl::SSLContext* sslContext, const std::string& serverName,
                                bool flag, Tarnik::Ref<Tarnik::Http::ConnectionSpec>& spec) {
  auto inner = Tarnik::MakeRef<SsoCustomConnectionSpecImpl>(host, port, flag);
  spec = Tarnik::MakeRef<SsoCustomSslConnectionSpecImpl>(sslContext, serverName, inner);
}

}  // namespace SsoClient
