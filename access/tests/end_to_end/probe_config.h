#ifndef SSOCLIENT_ACCESS_TESTS_END_TO_END_PROBE_CONFIG_H
#define SSOCLIENT_ACCESS_TESTS_END_TO_END_PROBE_CONFIG_H

#include <string>

#include <ssoclient/access/token_source.h>
#include <ssoclient/ssoclient.h>

namespace SsoClient::Access::Testing {

/// A password login as a program configures it from files: the TLS trust and the signing
/// certificate of the STS.
inline TokenSourceConfig ProbeConfig(const std::string& url, const std::string& caFile,
                                     const std::string& signingFile) {
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {caFile};
  TokenSourceConfig config;
  config.sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::LoadCertificates(signingFile));
  config.tokenFactory = CreateSamlTokenFactory(trustedKeys.get());
  config.endpoints = {{url, ""}};
  config.login = PasswordLogin{"alice@EXAMPLE.COM", [] { return std::string("secret"); }};
  return config;
}

inline TokenSpec ProbeSpec(int number) {
  TokenSpec spec;
  spec.tokenLifetimeSec = 600;
  spec.audienceRestriction = {"https://audience-" + std::to_string(number) + ".example.com"};
  return spec;
}

}  // namespace SsoClient::Access::Testing

#endif
