// Acquires a bearer token, but gives up after two seconds. Ends with status 3 if it has given up,
// and with status 1 if the call failed for another reason.
#include <chrono>
#include <iostream>
#include <string>

#include <ssoclient/ssoclient.h>
#include <tarnik/http/bounded_user_agent.h>
#include <tarnik/http/connection_specs.h>
#include <tarnik/http/http_url.h>

int main(int argc, char** argv) {
  if (argc != 5 || std::string(argv[1]).rfind("https://", 0) != 0) {
    std::cerr << "usage: limit_a_call HTTPS_URL CA_FILE STS_CERTIFICATE_FILE USER < password\n";
    return 2;
  }
  std::string password;
  std::getline(std::cin, password);
  const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(2);
  try {
    Tarnik::Ssl::SSLContextConfig tls;
    tls.caFiles = {argv[2]};
    const auto ssl = Tarnik::Ssl::CreateSSLContext(tls);
    const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
        Tarnik::Crypto::LoadCertificates(argv[3]));
    SsoClient::SecurityTokenServiceConfigEx config;
    config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
    bool isHttps = false;
    int port = 0;
    std::string host;
    Tarnik::Http::ParseHttpURL(argv[1], isHttps, host, port, config.url);

    // Once in the program: the connections of this agent serve all calls.
    const auto spec = Tarnik::Http::CreateTLSConnectionSpec(host, port, ssl.get(), "");
    const auto userAgent = Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr);

    // For each call. `limit->Cancel()` would end it even earlier, on any thread.
    const auto limit = Tarnik::Http::CreateCallLimit(deadline);
    config.userAgent = Tarnik::Http::CreateBoundedUserAgent(userAgent.get(), limit.get());
    const auto service = SsoClient::CreateSecurityTokenService(config);
    SsoClient::TokenSpec request;
    request.tokenLifetimeSec = 3600;
    const auto token = service->AcquireToken(argv[4], password, request);
    std::cout << SsoClient::CreateSamlTokenDescription(*token) << '\n';
  } catch (const std::exception& e) {
    const bool hasGivenUp = std::chrono::steady_clock::now() >= deadline;
    (hasGivenUp ? std::cout << "given up: " : std::cerr << "No token: ") << e.what() << '\n';
    return hasGivenUp ? 3 : 1;
  }
}
