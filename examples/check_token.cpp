// The receiving side: decides whether to accept a token that a peer presents. PEER_CERTIFICATE is
// the certificate with which the peer proved its identity, for example in a TLS handshake.
#include <cstring>
#include <fstream>
#include <iostream>
#include <iterator>
#include <set>
#include <string>

#include <ssoclient/ssoclient.h>

namespace {

bool IsSame(const Tarnik::Crypto::Certificate& left, const Tarnik::Crypto::Certificate& right) {
  return left.DerLength() == right.DerLength() &&
         std::memcmp(left.DerBytes(), right.DerBytes(), left.DerLength()) == 0;
}

}  // namespace

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
    const auto peer = Tarnik::Crypto::LoadCertificates(argv[3]).front();

    const auto token = SsoClient::CreateSamlToken(text, trustedKeys.get());
    std::set<std::string> audiences;
    token->GetAudiences(audiences);
    const auto holder = token->HolderOfKeyCertificate();
    if (!audiences.empty() && audiences.count(argv[4]) == 0) {
      std::cout << "refused: the token is for other audiences\n";
    } else if (holder != nullptr && !IsSame(*holder, *peer)) {
      std::cout << "refused: the token is bound to another key\n";
    } else {
      std::cout << "accepted: " << token->Subject().name << '@' << token->Subject().domain << '\n';
    }
  } catch (const std::exception& e) {
    std::cout << "refused: " << e.what() << '\n';
  }
  return 0;
}
