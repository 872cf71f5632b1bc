#ifndef SSOCLIENT_TRANSPORT_SSO_CONNECTION_SPECS_H
#define SSOCLIENT_TRANSPORT_SSO_CONNECTION_SPECS_H

#include <string>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/core/weak_linkable_impl.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/system/cancellable_item.h>

namespace SsoClient {

/// Opens plain TCP connections. The interface is a virtual base, so the overrides below have slots
/// of their own in this class's vtable, in the order of their declaration.
class SsoCustomConnectionSpecImpl final : public virtual Tarnik::Http::CustomConnectionSpec,
                                          public Tarnik::WeakLinkableImpl<Tarnik::ObjectImpl> {
 public:
  SsoCustomConnectionSpecImpl(std::string host, int port, bool flag);

  /// "<cs p:ADDRESS, SsoCustomConnectionSpec:HOST:PORT>".
  std::string ToString() const override;

  /// These three are about the configured host, even when a replacement host is connected to.
  std::string Host() const override;
  std::string CookieHost() const override;
  std::string EndpointKey() const override;
  bool IsProxy() const override;
  Tarnik::Ref<Tarnik::System::CancellableItem> StartConnect(ConnectCompletion completion) override;

  /// The host to connect to: a replacement host if there is one and the flag allows it, otherwise
  /// the configured host.
  std::string ChooseHost() const;

  /// Connects to `host` at this spec's port.
  Tarnik::Ref<Tarnik::System::CancellableItem> StartConnectTo(const std::string& host,
                                                              ConnectCompletion completion) const;

 private:
  std::string host_;
  int port_;
  bool flag_;
};

/// Opens the TCP connections of an inner spec and runs a TLS handshake on them. Describes itself as
/// the inner spec does, so that log lines of both kinds look alike. Slots as in the inner spec's
/// class.
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
  /// The completion receives the TLS stream even when the handshake failed: check the exception.
  Tarnik::Ref<Tarnik::System::CancellableItem> StartConnect(ConnectCompletion completion) override;

 private:
  Tarnik::Ref<Tarnik::Ssl::SSLContext> sslContext_;
  std::string serverName_;
  Tarnik::Ref<SsoCustomConnectionSpecImpl> inner_;
};

/// Creates a spec of plain TCP connections to `host` and `port`. With `flag`, each connection first
/// looks for a replacement host.
void CreateSsoConnectionSpec(const std::string& host, int port, bool flag,
                             Tarnik::Ref<Tarnik::Http::ConnectionSpec>& spec);

/// Creates a spec of TLS connections over the same. The peer must be `serverName` or, if that is
/// empty, the host connected to. `sslContext` must not be null; the spec keeps a reference to it.
void CreateSsoSSLConnectionSpec(const std::string& host, int port,
                                Tarnik::Ssl::SSLContext* sslContext, const std::string& serverName,
                                bool flag, Tarnik::Ref<Tarnik::Http::ConnectionSpec>& spec);

}  // namespace SsoClient

#endif
