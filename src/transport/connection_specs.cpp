#include "transport/connection_specs.h"

#include "transport/sso_custom_connection_spec_impl.h"
#include "transport/sso_custom_ssl_connection_spec_impl.h"

namespace SsoClient {

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
