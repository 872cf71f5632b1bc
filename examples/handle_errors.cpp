// Shows how to handle each kind of failure of a login.
#include <iostream>
#include <string>

#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc != 5) {
    std::cerr << "usage: handle_errors URL CA_FILE STS_CERTIFICATE_FILE USER < password\n";
    return 2;
  }
  std::string password;
  std::getline(std::cin, password);
  try {
    Tarnik::Ssl::SSLContextConfig tls;
    tls.caFiles = {argv[2]};
    const auto sslContext = Tarnik::Ssl::CreateSSLContext(tls);
    const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
        Tarnik::Crypto::LoadCertificates(argv[3]));
    SsoClient::SecurityTokenServiceConfig config;
    config.url = argv[1];
    config.sslContext = sslContext.get();
    config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());

    SsoClient::TokenSpec spec;
    spec.tokenLifetimeSec = 3600;
    SsoClient::CreateSecurityTokenService(config)->AcquireToken(argv[4], password, spec);
    std::cout << "logged in\n";
  } catch (const SsoClient::InvalidCredentialsException&) {
    std::cout << "ask for user name and password again\n";
  } catch (const SsoClient::PasswordExpiredException&) {
    std::cout << "ask the user to change the password\n";
  } catch (const SsoClient::CommunicationException& e) {
    std::cout << "try again later, and tell the operator: " << e.what() << '\n';
  } catch (const SsoClient::InvalidTokenException& e) {
    std::cout << "do not retry; check trusted certificates and clocks: " << e.what() << '\n';
  } catch (const SsoClient::SsoException& e) {
    std::cout << "the request failed: " << e.what() << '\n';
  } catch (const Tarnik::Exception& e) {
    std::cout << "fix the configuration or the call: " << e.what() << '\n';
  }
  return 0;
}
