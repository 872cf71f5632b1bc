#include <iostream>
#include <string>

#include <ssoclient/gssapi_negotiation_handler.h>
#include <ssoclient/ssoclient.h>

namespace {

bool RefusesAnEmptyService() {
  try {
    SsoClient::CreateGssapiNegotiationHandler({});
  } catch (const Tarnik::InvalidArgumentException& e) {
    return std::string(e.what()) ==
           "GssapiNegotiationConfig: the target service must not be empty.";
  }
  return false;
}

bool ReportsThatThereAreNoTickets() {
  SsoClient::GssapiNegotiationConfig config;
  config.targetService = "HTTP@sts.example";
  config.credentialCache = "FILE:/nonexistent/cache";
  const auto handler = SsoClient::CreateGssapiNegotiationHandler(config);

  SsoClient::SecurityTokenServiceConfig serviceConfig;
  serviceConfig.url = "http://127.0.0.1:1/sts";
  serviceConfig.tokenFactory = SsoClient::CreateSamlTokenFactory(nullptr);
  const auto service = SsoClient::CreateSecurityTokenService(serviceConfig);
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 60;
  try {
    service->AcquireTokenByGSS(spec, *handler);
  } catch (const SsoClient::SsoException& e) {
    return std::string(e.what()).find("There are no credentials to log in with: ") == 0;
  }
  return false;
}

}  // namespace

int main() {
  if (!RefusesAnEmptyService() || !ReportsThatThereAreNoTickets()) {
    std::cerr << "The installed Kerberos library does not work as expected.\n";
    return 1;
  }
  std::cout << "The installed Kerberos library works.\n";
  return 0;
}
