#include "options/presenter_options.h"

#include <array>
#include <cstddef>
#include <vector>

#include <CLI/CLI.hpp>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/data_signature.h>

#include "failure.h"
#include "input/private_file.h"

namespace SsoClient::Tool {
namespace {

using Tarnik::Crypto::SignatureAlgorithm;

constexpr std::size_t kMaxProofBytes = std::size_t{16} * 1024 * 1024;

struct NamedAlgorithm {
  const char* name;
  SignatureAlgorithm algorithm;
};

constexpr std::array<NamedAlgorithm, 9> kAlgorithms{{
    {"rsa-sha256", SignatureAlgorithm::kRsaPkcs1Sha256},
    {"rsa-sha384", SignatureAlgorithm::kRsaPkcs1Sha384},
    {"rsa-sha512", SignatureAlgorithm::kRsaPkcs1Sha512},
    {"rsa-pss-sha256", SignatureAlgorithm::kRsaPssSha256},
    {"rsa-pss-sha384", SignatureAlgorithm::kRsaPssSha384},
    {"rsa-pss-sha512", SignatureAlgorithm::kRsaPssSha512},
    {"ecdsa-sha256", SignatureAlgorithm::kEcdsaSha256},
    {"ecdsa-sha384", SignatureAlgorithm::kEcdsaSha384},
    {"ecdsa-sha512", SignatureAlgorithm::kEcdsaSha512},
}};

const NamedAlgorithm* FindAlgorithm(const std::string& name) {
  for (const NamedAlgorithm& each : kAlgorithms) {
    if (name == each.name) {
      return &each;
    }
  }
  return nullptr;
}

std::string AlgorithmNames() {
  std::string names;
  for (const NamedAlgorithm& each : kAlgorithms) {
    names += (names.empty() ? "" : ", ") + std::string(each.name);
  }
  return names;
}

std::string CheckAlgorithm(const std::string& name) {
  return FindAlgorithm(name) != nullptr ? "" : "'" + name + "' is not one of " + AlgorithmNames();
}

[[noreturn]] void FailToRead(const std::string& path, const std::string& reason) {
  throw ToolException(
      {ExitStatus::kLocal, "proof-file", "cannot read " + path + ": " + reason, ""});
}

// Neither the data nor its signature is secret.
std::string ReadFile(const std::string& path) {
  const SecretText content = ReadPrivateFile(
      {.path = path, .what = "proof", .maxBytes = kMaxProofBytes, .mayBeOpen = true});
  if (content.Text().empty()) {
    FailToRead(path, "it is empty");
  }
  return content.Text();
}

Tarnik::Ref<const Tarnik::Crypto::Certificate> ReadCertificate(const std::string& path) {
  try {
    return Tarnik::Crypto::LoadPemOrDerCertificates(path).front();
  } catch (const Tarnik::Exception& exception) {
    FailToRead(path, exception.what());
  }
}

}  // namespace

void PresenterOptions::AddTo(CLI::App& command) {
  CLI::Option* const certificate =
      command
          .add_option("--tls-certificate", certificatePath_,
                      "The certificate with which the sender of the token has proved its key in a "
                      "TLS handshake")
          ->type_name("FILE")
          ->group("Proof");
  CLI::Option* const data =
      command
          .add_option("--proof-data", dataPath_,
                      "The data that the sender of the token has signed, at most 16 MiB")
          ->type_name("FILE")
          ->excludes(certificate)
          ->group("Proof");
  CLI::Option* const signature =
      command
          .add_option(
              "--proof-signature", signaturePath_,
              "The sender's signature of the data, in binary form; that of an EC key in DER")
          ->type_name("FILE")
          ->needs(data)
          ->group("Proof");
  data->needs(signature);
  command
      .add_option("--proof-algorithm", algorithm_,
                  "The algorithm of the sender's signature: " + AlgorithmNames())
      ->type_name("NAME")
      ->capture_default_str()
      ->check(CheckAlgorithm)
      ->needs(signature)
      ->group("Proof");
}

Access::Presenter PresenterOptions::MakePresenter() const {
  if (!certificatePath_.empty()) {
    return Access::Presenter::WithTlsCertificate(ReadCertificate(certificatePath_));
  }
  if (dataPath_.empty()) {
    return Access::Presenter::Nobody();
  }
  const std::string signature = ReadFile(signaturePath_);
  return Access::Presenter::WithSignature(ReadFile(dataPath_), {signature.begin(), signature.end()},
                                          FindAlgorithm(algorithm_)->algorithm);
}

}  // namespace SsoClient::Tool
