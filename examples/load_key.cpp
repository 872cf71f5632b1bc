// Loads a private key and its certificate from files or a device. The passphrase or PIN is read
// only if the key needs one.
#include <iostream>
#include <string>

#include <ssoclient/ssoclient.h>

namespace {

std::string ReadPassphrase() {
  std::string line;
  std::getline(std::cin, line);
  return line;
}

SsoClient::HolderOfKeyConfig Load(const std::string& key, const std::string& certificateFile) {
  if (certificateFile.empty()) {
    const auto both = Tarnik::Crypto::LoadKeyAndCertificate(key, ReadPassphrase);  // PKCS#12
    return {both.certificate, both.privateKey};
  }
  const auto certificate = Tarnik::Crypto::LoadCertificates(certificateFile).front();
  if (key.front() == '/' || key.front() == '.') {
    return {certificate, Tarnik::Crypto::LoadPrivateKey(key, ReadPassphrase)};  // PEM
  }
  return {certificate, Tarnik::Crypto::LoadPrivateKeyFromUri(key, ReadPassphrase)};
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2 && argc != 3) {
    std::cerr << "usage: load_key PKCS12_FILE < passphrase\n"
                 "       load_key KEY_FILE_OR_URI CERTIFICATE_FILE < passphrase\n";
    return 2;
  }
  try {
    const auto config = Load(argv[1], argc == 3 ? argv[2] : "");
    const bool isPair = config.privateKey->Matches(*config.certificate);
    std::cout << (isPair ? "the key of " : "NOT the key of ") << config.certificate->SubjectName()
              << "; its certificate is valid until " << config.certificate->NotAfter().ToString()
              << '\n';
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "No key: " << e.what() << '\n';
    return 1;
  }
}
