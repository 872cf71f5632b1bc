// Signs with a key of a TPM and verifies the signature. Usage: device_key_probe URI METHOD [PIN]
// A separate program, since a loaded provider serves the whole process.
#include <iostream>
#include <string>

#include <openssl/provider.h>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/xml/security/signature.h>

#include "support/one_key_resolver.h"

namespace {

using Tarnik::Ref;
using Tarnik::Crypto::PassphraseCallback;
using Tarnik::Crypto::PrivateKey;
using Tarnik::Xml::ElementNode;
namespace Security = Tarnik::Xml::Security;

constexpr const char* kExclusive = "http://www.w3.org/2001/10/xml-exc-c14n#";

bool SignsWhatVerifies(const PrivateKey& key, const std::string& method) {
  Ref<ElementNode> root;
  CreateElementNode("", "Request", root);
  root->SetAttribute("ID", "request");
  Ref<Security::Signature> signature;
  Security::CreateBlankSignature(root.get(), kExclusive, method, "ds", signature);
  const auto reference =
      signature->AddReference("#request", "http://www.w3.org/2001/04/xmlenc#sha256");
  reference->AddTransform("http://www.w3.org/2000/09/xmldsig#enveloped-signature");
  reference->AddTransform(kExclusive);
  root->AppendChild(signature->Element());
  signature->Sign(&key);
  return signature->Verify(
      Tarnik::MakeRef<Tarnik::Testing::OneKeyResolver>(key.GetPublicKey()).get());
}

}  // namespace

int main(int argc, char** argv) {
  if (argc < 3) {
    return 2;
  }
  if (OSSL_PROVIDER_load(nullptr, "default") == nullptr ||
      OSSL_PROVIDER_load(nullptr, "tpm2") == nullptr) {
    std::cout << "no provider\n";
    return 1;
  }
  int asked = 0;
  PassphraseCallback pin;
  if (argc > 3) {
    pin = [&asked, argv] {
      ++asked;
      return std::string(argv[3]);
    };
  }
  try {
    const Ref<const PrivateKey> key = Tarnik::Crypto::LoadPrivateKeyFromUri(argv[1], pin);
    std::cout << (SignsWhatVerifies(*key, argv[2]) ? "verified" : "not verified") << ", asked "
              << asked << " times\n";
  } catch (const Tarnik::Exception& error) {
    std::cout << error.Message() << "\n";
  }
  return 0;
}
