// Proves possession of a token's key without TLS: a client signs a challenge of the server. Both
// sides are in this program. Ends with status 1 if the token is refused.
#include <fstream>
#include <iostream>
#include <iterator>
#include <string>

#include <ssoclient/access/token_gate.h>
#include <ssoclient/ssoclient.h>
#include <tarnik/crypto/data_signature.h>
#include <tarnik/crypto/digest.h>
#include <tarnik/text/string_util.h>

using namespace SsoClient::Access;
constexpr auto kAlgorithm = Tarnik::Crypto::SignatureAlgorithm::kRsaPssSha256;

// A label that no other protocol of the key uses, the challenge, and which token is presented.
static std::string DataToSign(const std::string& challenge, const std::string& token) {
  const auto digest = Tarnik::Crypto::Sha256(token);
  return "orders login 1\n" + challenge + "\n" + std::string(digest.begin(), digest.end());
}

int main(int argc, char** argv) try {
  if (argc != 6) {
    std::cerr << "usage: prove_possession ISSUER STS_CERTIFICATES OWN_NAME TOKEN_FILE KEY_FILE\n";
    return 2;
  }
  std::ifstream file(argv[4]);
  const std::string token(std::istreambuf_iterator<char>(file), {});
  TrustStoreConfig trust;
  trust.issuers.resize(1);
  trust.issuers[0].issuer = argv[1];
  trust.issuers[0].certificatePaths = {argv[2]};
  GateConfig config{"orders", CreateTrustStore(trust), {argv[3]}, false, BearerTokens::kRefuse};
  const auto gate = CreateTokenGate(config);

  // The server chooses 122 random bits, sends them, and remembers them until they are used once.
  const std::string challenge = Tarnik::StringUtil::GenerateUuid();
  // The client signs with the key that the token is bound to, and sends token and signature.
  const auto key = Tarnik::Crypto::LoadPrivateKey(argv[5]);
  const auto proof = Tarnik::Crypto::SignData(*key, kAlgorithm, DataToSign(challenge, token));
  // The server makes the data itself, with the algorithm that its protocol says.
  const auto presenter = Presenter::WithSignature(DataToSign(challenge, token), proof, kAlgorithm);
  const Verdict verdict = gate->Check(token, presenter);
  std::cout << verdict.ToString();
  return verdict.IsAccepted() ? 0 : 1;
} catch (const std::exception& e) {
  std::cerr << "prove_possession: " << e.what() << '\n';
  return 2;
}
