#include "support/resigned.h"

#include <cstddef>
#include <memory>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include <openssl/bn.h>
#include <openssl/ec.h>
#include <openssl/evp.h>
#include <openssl/pem.h>

#include <devsts/xml_security.h>
#include <tarnik/text/string_util.h>

namespace SsoClient::Testing {
namespace {

constexpr int kNumberLength = 32;
constexpr std::string_view kValueBegin = "<ds:SignatureValue>";
constexpr std::string_view kValueEnd = "</ds:SignatureValue>";

void RequireOfSigning(bool condition, const char* what) {
  if (!condition) {
    throw std::logic_error(what);
  }
}

template <class T, void (*Free)(T*)>
struct Deleter {
  void operator()(T* object) const noexcept { Free(object); }
};
using OwnedKey = std::unique_ptr<EVP_PKEY, Deleter<EVP_PKEY, EVP_PKEY_free>>;
using OwnedContext = std::unique_ptr<EVP_MD_CTX, Deleter<EVP_MD_CTX, EVP_MD_CTX_free>>;
using OwnedNumbers = std::unique_ptr<ECDSA_SIG, Deleter<ECDSA_SIG, ECDSA_SIG_free>>;

OwnedKey KeyOf(const std::string& pem) {
  BIO* const source = BIO_new_mem_buf(pem.data(), static_cast<int>(pem.size()));
  OwnedKey key(PEM_read_bio_PrivateKey(source, nullptr, nullptr, nullptr));
  BIO_free(source);
  RequireOfSigning(key != nullptr, "no key");
  return key;
}

std::vector<unsigned char> NumbersOf(const std::vector<unsigned char>& der) {
  const unsigned char* bytes = der.data();
  const OwnedNumbers numbers(d2i_ECDSA_SIG(nullptr, &bytes, static_cast<long>(der.size())));
  std::vector<unsigned char> octets(std::size_t{2} * kNumberLength);
  RequireOfSigning(numbers != nullptr &&
                       BN_bn2binpad(ECDSA_SIG_get0_r(numbers.get()), octets.data(),
                                    kNumberLength) == kNumberLength &&
                       BN_bn2binpad(ECDSA_SIG_get0_s(numbers.get()), octets.data() + kNumberLength,
                                    kNumberLength) == kNumberLength,
                   "no ECDSA signature");
  return octets;
}

std::vector<unsigned char> SignEcdsa(const std::string& text, EVP_PKEY* key) {
  const OwnedContext context(EVP_MD_CTX_new());
  std::vector<unsigned char> der(static_cast<std::size_t>(EVP_PKEY_get_size(key)));
  std::size_t length = der.size();
  const auto* octets = reinterpret_cast<const unsigned char*>(text.data());
  RequireOfSigning(EVP_DigestSignInit_ex(context.get(), nullptr, "SHA256", nullptr, nullptr, key,
                                         nullptr) == 1 &&
                       EVP_DigestSign(context.get(), der.data(), &length, octets, text.size()) == 1,
                   "signing has failed");
  der.resize(length);
  return NumbersOf(der);
}

}  // namespace

std::string Resigned(const std::string& xml, const DevSts::Credential& credential) {
  const std::string text = DevSts::Canonicalize(xml, "(//*[local-name()='SignedInfo'])[1]",
                                                DevSts::CanonicalMode::Exclusive);
  return WithSignatureValue(xml, SignEcdsa(text, KeyOf(credential.privateKeyPem).get()));
}

std::vector<unsigned char> SignatureValueOf(const std::string& xml) {
  const std::size_t begin = xml.find(kValueBegin) + kValueBegin.size();
  std::vector<unsigned char> octets;
  Tarnik::StringUtil::Base64Decode(xml.substr(begin, xml.find(kValueEnd) - begin), octets);
  return octets;
}

std::string WithSignatureValue(const std::string& xml, const std::vector<unsigned char>& octets) {
  const std::size_t begin = xml.find(kValueBegin) + kValueBegin.size();
  const std::size_t end = xml.find(kValueEnd);
  return xml.substr(0, begin) + Tarnik::StringUtil::Base64Encode(octets) + xml.substr(end);
}

std::vector<unsigned char> InDer(const std::vector<unsigned char>& numbers) {
  const OwnedNumbers signature(ECDSA_SIG_new());
  RequireOfSigning(
      ECDSA_SIG_set0(signature.get(), BN_bin2bn(numbers.data(), kNumberLength, nullptr),
                     BN_bin2bn(numbers.data() + kNumberLength, kNumberLength, nullptr)) == 1,
      "no numbers");
  std::vector<unsigned char> der(static_cast<std::size_t>(i2d_ECDSA_SIG(signature.get(), nullptr)));
  unsigned char* out = der.data();
  i2d_ECDSA_SIG(signature.get(), &out);
  return der;
}

}  // namespace SsoClient::Testing
