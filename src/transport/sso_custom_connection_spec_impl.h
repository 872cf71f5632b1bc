#ifndef SSOCLIENT_TRANSPORT_SSO_CUSTOM_CONNECTION_SPEC_IMPL_H
#define SSOCLIENT_TRANSPORT_SSO_CUSTOM_CONNECTION_SPEC_IMPL_H

#include <string>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/core/weak_linkable_impl.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/system/cancellable_item.h>

namespace SsoClient {

/// Opens plain TCP connections. The overrides below take slots of their own in this class's vtable,
/// in the order of their declaration, since the interface is a virtual base.
class SsoCustomConnectionSpecImpl final : public virtual Tarnik::Http::CustomConnectionSpec,
                                          public Tarnik::WeakLinkableImpl<Tarnik::ObjectImpl> {
 public:
  SsoCustomConnectionSpecImpl(std::string host, int port, bool flag);

  /// "<cs p:ADDRESS, SsoCustomConnectionSpec:HOST:PORT>".
  std::string ToString() const override;

  /// These three tell the configured host, whatever host is connected to.
  std::string Host() const override;
  std::string CookieHost() const override;
  std::string EndpointKey() const override;
  bool IsProxy() const override;
  Tarnik::Ref<Tarnik::System::CancellableItem> StartConnect(ConnectCompletion completion) override;

  /// The host to connect to: a replacement if there is one and the flag allows it, else the
  /// configured host.
  std::string ChooseHost() const;

  /// Connects to `host` at this spec's port.
  Tarnik::Ref<Tarnik::System::CancellableItem> StartConnectTo(const std::string& host,
                                                              ConnectCompletion completion) const;

 private:
  std::string host_;
  int port_;
  bool flag_;
};

}  // namespace SsoClient

#endif
