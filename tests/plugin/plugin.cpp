// A plug-in that uses the libraries, while its host does not.
#include "plugin/plugin.h"

#include <ssoclient/ssoclient.h>

#ifdef PLUGIN_USES_KERBEROS
#include <ssoclient/gssapi_negotiation_handler.h>
#endif

bool RunFailingCall(const char* url,
                    const SsoClient::SecurityTokenService::TokenCallback* callback) {
#ifdef PLUGIN_USES_KERBEROS
  SsoClient::GssapiNegotiationConfig kerberos;
  kerberos.targetService = "HTTP@sts.example";
  const auto handler = SsoClient::CreateGssapiNegotiationHandler(kerberos);
#endif
  SsoClient::SecurityTokenServiceConfig config;
  config.url = url;
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(nullptr);
  const auto service = SsoClient::CreateSecurityTokenService(config);
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 60;
  if (callback != nullptr) {
    service->AcquireTokenAsync("user", "password", spec, *callback);
    return true;
  }
  try {
    service->AcquireToken("user", "password", spec);
  } catch (const SsoClient::CommunicationException&) {
    return true;
  }
  return false;
}
