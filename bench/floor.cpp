#include "floor.h"

#include <array>
#include <stdexcept>
#include <vector>

#include <openssl/evp.h>
#include <openssl/rsa.h>

namespace Bench {
namespace {

void Require(bool isGood) {
  if (!isGood) {
    throw std::runtime_error("OpenSSL failed");
  }
}

}  // namespace

struct Floor::State {
  EVP_PKEY* key = nullptr;
  EVP_MD* sha256 = nullptr;
  EVP_MD_CTX* digest = nullptr;
  EVP_PKEY_CTX* verify = nullptr;
  std::array<unsigned char, 32> hash{};
  std::vector<unsigned char> signature;

  State() {
    key = EVP_RSA_gen(2048);
    sha256 = EVP_MD_fetch(nullptr, "SHA256", nullptr);
    digest = EVP_MD_CTX_new();
    Require(key != nullptr && sha256 != nullptr && digest != nullptr);
    Sign();
    verify = EVP_PKEY_CTX_new(key, nullptr);
    Require(EVP_PKEY_verify_init(verify) == 1);
    Require(EVP_PKEY_CTX_set_rsa_padding(verify, RSA_PKCS1_PADDING) == 1);
    Require(EVP_PKEY_CTX_set_signature_md(verify, sha256) == 1);
  }

  ~State() {
    EVP_PKEY_CTX_free(verify);
    EVP_MD_CTX_free(digest);
    EVP_MD_free(sha256);
    EVP_PKEY_free(key);
  }

  State(const State&) = delete;
  State& operator=(const State&) = delete;

  void Sign() {
    EVP_PKEY_CTX* context = EVP_PKEY_CTX_new(key, nullptr);
    std::size_t length = 0;
    Require(EVP_PKEY_sign_init(context) == 1);
    Require(EVP_PKEY_CTX_set_rsa_padding(context, RSA_PKCS1_PADDING) == 1);
    Require(EVP_PKEY_CTX_set_signature_md(context, sha256) == 1);
    Require(EVP_PKEY_sign(context, nullptr, &length, hash.data(), hash.size()) == 1);
    signature.resize(length);
    Require(EVP_PKEY_sign(context, signature.data(), &length, hash.data(), hash.size()) == 1);
    signature.resize(length);
    EVP_PKEY_CTX_free(context);
  }
};

Floor::Floor() : state_(std::make_unique<State>()) {}
Floor::~Floor() = default;

bool Floor::Check(const std::string& text) {
  std::array<unsigned char, 32> hash{};
  const bool isDigested = EVP_DigestInit_ex2(state_->digest, state_->sha256, nullptr) == 1 &&
                          EVP_DigestUpdate(state_->digest, text.data(), text.size()) == 1 &&
                          EVP_DigestFinal_ex(state_->digest, hash.data(), nullptr) == 1;
  return isDigested &&
         EVP_PKEY_verify(state_->verify, state_->signature.data(), state_->signature.size(),
                         state_->hash.data(), state_->hash.size()) == 1;
}

}  // namespace Bench
