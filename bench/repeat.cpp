// The main function of programs whose instructions are counted: PROGRAM FOLDER OPERATION COUNT
// calls an operation COUNT times, with the token and keys in FOLDER. PROGRAM FOLDER makes them.
// Two runs with different counts differ by the cost of the operation only, without that to start.
#include "repeat.h"

#include <exception>
#include <fstream>
#include <iostream>
#include <iterator>
#include <stdexcept>

#include <devsts/certificates.h>

namespace Bench {
namespace {

constexpr std::size_t kTokenSize = 6000;

void Write(const std::string& path, const std::string& text) {
  std::ofstream file(path, std::ios::binary);
  file << text;
  if (!file.flush()) {
    throw std::runtime_error("Cannot write " + path);
  }
}

std::string Read(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  if (!file) {
    throw std::runtime_error("Cannot read " + path);
  }
  return {std::istreambuf_iterator<char>(file), {}};
}

void MakeInputs(const std::string& folder) {
  DevSts::CertificateSpec spec;
  spec.commonName = "client";
  spec.keyType = DevSts::KeyType::Rsa2048;
  const DevSts::Credential client = DevSts::MakeCertificate(spec);
  const SampleToken& token = GetSampleToken(kTokenSize);
  Write(folder + "/token.xml", token.xml);
  Write(folder + "/signing.pem", token.certificatePem);
  Write(folder + "/client.pem", client.certificatePem);
  Write(folder + "/client.key", client.privateKeyPem);
}

RepeatInputs ReadInputs(const std::string& folder) {
  return {{Read(folder + "/token.xml"), Read(folder + "/signing.pem")},
          Read(folder + "/client.pem"),
          Read(folder + "/client.key")};
}

void Repeat(const std::string& folder, const std::string& name, unsigned long count) {
  const auto operation = PrepareOperation(name, ReadInputs(folder));
  if (!operation) {
    throw std::runtime_error("There is no operation " + name);
  }
  for (unsigned long i = 0; i < count; ++i) {
    operation();
  }
}

}  // namespace
}  // namespace Bench

int main(int argc, char** argv) {
  if (argc != 2 && argc != 4) {
    std::cerr << "usage: " << argv[0] << " FOLDER [OPERATION COUNT]\n";
    return 2;
  }
  try {
    if (argc == 2) {
      Bench::MakeInputs(argv[1]);
    } else {
      Bench::Repeat(argv[1], argv[2], std::stoul(argv[3]));
    }
    return 0;
  } catch (const std::exception& e) {
    std::cerr << argv[0] << ": " << e.what() << '\n';
    return 1;
  }
}
