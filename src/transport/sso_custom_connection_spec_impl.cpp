#include "transport/sso_custom_connection_spec_impl.h"

#include <utility>

#include <tarnik/system/tcp_client_socket.h>
#include <tarnik/system/thread_pool.h>
#include <tarnik/text/print.h>

namespace SsoClient {

namespace {

using Tarnik::System::TCPClientSocket;

// The place where a source of replacement hosts plugs in; none is built in.
std::string FindReplacementHost() {
  return {};
}

TCPClientSocket::ConnectCompletion AsSocketCompletion(
    Tarnik::Http::CustomConnectionSpec::ConnectCompletion completion) {
  if (!completion) {
    return nullptr;
  }
  return [completion = std::move(completion)](TCPClientSocket* socket, Tarnik::Exception* error) {
    completion(socket, error);
  };
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
  return Tarnik::System::CreateCancellableItem([socket] {
    socket->Close();
    return true;
  });
}

}  // namespace SsoClient
