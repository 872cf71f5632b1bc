#ifndef SSOCLIENT_TRANSPORT_SSO_CUSTOM_SSL_CONNECTION_SPEC_IMPL_H
#define SSOCLIENT_TRANSPORT_SSO_CUSTOM_SSL_CONNECTION_SPEC_IMPL_H

#include <string>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/core/weak_linkable_impl.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/system/cancellable_item.h>

#include "transport/sso_custom_connection_spec_impl.h"

namespace SsoClient {

/// Opens the TCP connections of an inner spec and runs a TLS handshake on them. Tells everything
/// about itself as the inner spec does, so that log lines of both kinds look alike. Slots as in the
/// inner spec's class.
class SsoCustomSslConnectionSpecImpl final : public virtual Tarnik::Http::CustomConnectionSpec,
                                             public Tarnik::WeakLinkableImpl<Tarnik::ObjectImpl> {
 public:
  SsoCustomSslConnectionSpecImpl(Tarnik::Ssl::SSLContext* sslContext, std::string serverName,
                                 Tarnik::Ref<SsoCustomConnectionSpecImpl> inner);

  std::string ToString() const override;

  std::string Host() const override;
  std::string CookieHost() const override;
  std::string EndpointKey() const override;
  bool IsProxy() const override;
  /// The completion gets the TLS stream also with a failed handshake: the exception decides.
  Tarnik::Ref<Tarnik::System::CancellableItem> StartConnect(ConnectCompletion completion) override;

 private:
  Tarnik::Ref<Tarnik::Ssl::SSLContext> sslContext_;
  std::string serverName_;
  Tarnik::Ref<SsoCustomConnectionSpecImpl> inner_;
};

}  // namespace SsoClient

#endif
