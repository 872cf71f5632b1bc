#include <iostream>
#include <string>

#include <ssoclient/ssoclient.h>

namespace {

bool RefusesAnotherElement() {
  try {
    SsoClient::CreateSamlToken("<Response/>");
  } catch (const SsoClient::InvalidTokenException& e) {
    return std::string(e.what()) == "Expected element 'Assertion' not found.";
  }
  return false;
}

bool ReportsThatNobodyListens() {
  SsoClient::SecurityTokenServiceConfig config;
  config.url = "http://127.0.0.1:1/sts";
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(nullptr);
  const auto service = SsoClient::CreateSecurityTokenService(config);
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 60;
  try {
    service->AcquireToken("user", "password", spec);
  } catch (const SsoClient::CommunicationException& e) {
    return std::string(e.what()).find("127.0.0.1:1") != std::string::npos;
  }
  return false;
}

}  // namespace

int main() {
  if (!RefusesAnotherElement() || !ReportsThatNobodyListens()) {
    std::cerr << "The installed library does not work as expected.\n";
    return 1;
  }
  std::cout << "The installed library works.\n";
  return 0;
}
