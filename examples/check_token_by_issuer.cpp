// The receiving side, with several services: verifies a token with the keys of the service that it
// names as its issuer. Ends with status 1 if it refuses the token.
#include <fstream>
#include <iostream>
#include <iterator>
#include <map>
#include <string>

#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc < 4 || argc % 2 != 0) {
    std::cerr << "usage: check_token_by_issuer TOKEN_FILE ISSUER STS_CERTIFICATE_FILE ...\n";
    return 2;
  }
  using Resolver = Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver>;
  try {
    std::map<std::string, Resolver> trustedKeys;
    for (int i = 2; i < argc; i += 2) {
      trustedKeys[argv[i]] = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
          Tarnik::Crypto::LoadCertificates(argv[i + 1]));
    }
    std::ifstream file(argv[1]);
    const std::string text(std::istreambuf_iterator<char>(file), {});
    if (text.empty()) {
      std::cerr << "cannot read " << argv[1] << '\n';
      return 2;
    }

    // The issuer is not verified yet: anyone may have written any name.
    const auto token = SsoClient::CreateSamlToken(text, [&](const SsoClient::SamlToken* parsed) {
      const auto found = trustedKeys.find(parsed->Issuer());
      return found == trustedKeys.end() ? Resolver() : found->second;
    });
    std::cout << "verified: " << token->Subject().name << " from " << token->Issuer() << '\n';
    return 0;
  } catch (const Tarnik::Exception& e) {
    std::cout << "refused: " << e.what() << '\n';
    return 1;
  }
}
