#include "transport/sso_custom_ssl_connection_spec_impl.h"

#include <utility>

namespace SsoClient {

namespace {

using ConnectCompletion = Tarnik::Http::CustomConnectionSpec::ConnectCompletion;

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
    // A server name that is none, for instance. Left to go on, it would end the I/O thread.
    completion(sslStream != nullptr ? sslStream.get() : stream, &refusal);
  }
}

}  // namespace

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

}  // namespace SsoClient
