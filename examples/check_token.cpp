// The receiving side: decides whether to accept a token from a peer that has proved its identity
// with PEER_CERTIFICATE, for example in a TLS handshake. Ends with status 1 if it does not.
#include <cstring>
#include <fstream>
#include <iostream>
#include <iterator>
#include <set>
#include <stdexcept>
#include <string>

#include <ssoclient/ssoclient.h>

static bool IsSame(const Tarnik::Crypto::Certificate& a, const Tarnik::Crypto::Certificate& b) {
  return a.DerLength() == b.DerLength() &&
         std::memcmp(a.DerBytes(), b.DerBytes(), a.DerLength()) == 0;
}

int main(int argc, char** argv) {
  if (argc != 5) {
    std::cerr << "usage: check_token STS_CERTIFICATE_FILE TOKEN_FILE PEER_CERTIFICATE OWN_NAME\n";
    return 2;
  }
  try {
    const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
        Tarnik::Crypto::LoadCertificates(argv[1]));
    std::ifstream file(argv[2]);
    const std::string text(std::istreambuf_iterator<char>(file), {});
    if (text.empty()) {
      throw std::runtime_error(std::string("cannot read ") + argv[2]);
    }
    const auto peer = Tarnik::Crypto::LoadCertificates(argv[3]).front();

    const auto token = SsoClient::CreateSamlToken(text, trustedKeys.get());
    std::set<std::string> audiences;
    token->GetAudiences(audiences);
    const auto holder = token->HolderOfKeyCertificate();
    if (!audiences.empty() && audiences.count(argv[4]) == 0) {
      std::cout << "refused: the token is for other audiences\n";
    } else if (holder == nullptr || !IsSame(*holder, *peer)) {
      std::cout << "refused: the token is not bound to the peer's key\n";
    } else {
      std::cout << "accepted: " << token->Subject().name << '@' << token->Subject().domain << '\n';
      return 0;
    }
  } catch (const std::exception& e) {
    std::cout << "refused: " << e.what() << '\n';
  }
  return 1;
}
