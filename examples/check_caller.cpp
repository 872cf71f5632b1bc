// Decides whether to accept a caller's token, and prints each check. The caller has proved in a TLS
// handshake that it has the key of PEER_CERTIFICATE; without one, it has proved nothing. Ends with
// status 1 if the token is refused.
#include <exception>
#include <fstream>
#include <iostream>
#include <iterator>
#include <stdexcept>
#include <string>

#include <ssoclient/access/token_gate.h>

int main(int argc, char** argv) {
  using namespace SsoClient::Access;
  if (argc != 5 && argc != 6) {
    std::cerr << "usage: check_caller ISSUER STS_CERTIFICATES OWN_NAME TOKEN_FILE"
                 " [PEER_CERTIFICATE]\n";
    return 2;
  }
  try {
    // Once: both objects are thread-safe, and the store reads its files again when they change.
    TrustStoreConfig trust;
    trust.issuers.resize(1);
    trust.issuers[0].issuer = argv[1];
    trust.issuers[0].certificatePaths = {argv[2]};
    GateConfig config;
    config.trust = CreateTrustStore(trust);
    config.audiences = {argv[3]};
    config.bearerTokens = BearerTokens::kRefuse;
    const auto gate = CreateTokenGate(config);

    // For each request
    std::ifstream file(argv[4]);
    const std::string text(std::istreambuf_iterator<char>(file), {});
    if (!file) {
      throw std::runtime_error(std::string("cannot read ") + argv[4]);
    }
    const auto presenter =
        argc == 5
            ? Presenter::Nobody()
            : Presenter::WithTlsCertificate(Tarnik::Crypto::LoadCertificates(argv[5]).front());
    const Verdict verdict = gate->Check(text, presenter);
    std::cout << verdict.ToString();
    return verdict.IsAccepted() ? 0 : 1;
  } catch (const std::exception& e) {
    std::cerr << "check_caller: " << e.what() << '\n';
    return 2;
  }
}
