// For the demo: acquires a token that is bound to a key, and sends it to a server over TLS, with
// the certificate of that key, or with another one, as a thief would. Prints the server's answer
// and saves the token.
#include <chrono>
#include <cstddef>
#include <exception>
#include <fstream>
#include <iostream>
#include <memory>
#include <string>

#include <ssoclient/access/token_source.h>
#include <ssoclient/ssoclient.h>
#include <tarnik/http/connection_specs.h>
#include <tarnik/http/http_request.h>
#include <tarnik/http/http_response.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/text/base64.h>

namespace {

using SsoClient::HolderOfKeyConfig;

constexpr unsigned long kTimeoutMicroseconds = 10'000'000;
constexpr char kOwnNameOfTheServer[] = "https://orders.example.com";

HolderOfKeyConfig LoadIdentity(const char* certificateFile, const char* keyFile) {
  return {Tarnik::Crypto::LoadCertificates(certificateFile).front(),
          Tarnik::Crypto::LoadPrivateKey(keyFile)};
}

std::shared_ptr<const SsoClient::SamlToken> Acquire(char** argv,
                                                    const HolderOfKeyConfig& identity) {
  std::string password;
  std::getline(std::cin, password);
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {argv[2]};
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::LoadCertificates(argv[3]));
  SsoClient::Access::TokenSourceConfig config;
  config.endpoints = {{argv[1]}};
  config.sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
  config.holderOfKey = identity;
  config.login = SsoClient::Access::PasswordLogin{argv[6], [=] { return password; }};
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  spec.audienceRestriction = {kOwnNameOfTheServer};
  return SsoClient::Access::CreateTokenSource(config)->GetToken(
      spec, SsoClient::Access::CallContext::Within(std::chrono::seconds(10)));
}

std::string Base64(const std::string& text) {
  const auto* const bytes = reinterpret_cast<const unsigned char*>(text.data());
  std::string result(Tarnik::Base64_EncodedLength(bytes, text.size()), '\0');
  std::size_t written = 0;
  Tarnik::Base64_Encode(bytes, text.size(), result.data(), result.size(), &written);
  return result;
}

Tarnik::Ref<Tarnik::Http::ClientResponse> Send(const std::string& token, int port,
                                               const char* caFile,
                                               const HolderOfKeyConfig& identity) {
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {caFile};
  tls.clientCertificate = identity.certificate;
  tls.clientPrivateKey = identity.privateKey;
  const auto sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  const auto spec = Tarnik::Http::CreateTLSConnectionSpec("127.0.0.1", port, sslContext.get(), "");
  const auto agent = Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  Tarnik::Ref<Tarnik::Http::ClientRequest> request;
  Tarnik::Http::CreateHttpRequest(Tarnik::Http::Method::GET, "/", request);
  request->SetHeader("Authorization", "Bearer " + Base64(token));
  const auto pending = agent->SendAsync(
      request.get(), [](auto&&...) {}, kTimeoutMicroseconds);
  return agent->Wait(pending.get(), 0);
}

void Print(const Tarnik::Http::ClientResponse& answer) {
  std::string body(1024, '\0');
  body.resize(answer.Body()->Read(body.data(), body.size()));
  std::cout << answer.Status().code << ' '
            << (body.empty() ? answer.Header("WWW-Authenticate").value_or("") + '\n' : body);
}

}  // namespace

int main(int argc, char** argv) try {
  if (argc != 10 && argc != 12) {
    std::cerr << "usage: call_guarded_server URL CA_FILE STS_CERTIFICATE_FILE CERTIFICATE_FILE"
                 " KEY_FILE USER SERVER_PORT SERVER_CA_FILE TOKEN_FILE"
                 " [OTHER_CERTIFICATE OTHER_KEY] < password\n";
    return 2;
  }
  const HolderOfKeyConfig owner = LoadIdentity(argv[4], argv[5]);
  const HolderOfKeyConfig sender = argc == 10 ? owner : LoadIdentity(argv[10], argv[11]);
  const auto token = Acquire(argv, owner);
  std::ofstream(argv[9]) << token->Xml();
  Print(*Send(token->Xml(), std::stoi(argv[7]), argv[8], sender));
  return 0;
} catch (const std::exception& e) {
  std::cerr << "call_guarded_server: " << e.what() << '\n';
  return 1;
}
