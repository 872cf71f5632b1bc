// Certificates, private keys, PKCS#12 and revocation lists from the input are loaded, or refused
// with a `CryptoException`. What is loaded equals what OpenSSL's own readers return, and what is
// refused without a rule of ours they refuse too; for revocation lists see list_model.h. The first
// byte of the input is the kind of the others.
#include <algorithm>
#include <cstdlib>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <openssl/err.h>
#include <openssl/pem.h>
#include <openssl/pkcs12.h>

#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/crypto/revocation_list.h>

#include "certificate_values.h"
#include "crypto/private_key_impl.h"
#include "fixed_random.h"
#include "input.h"
#include "list_model.h"
#include "support/openssl.h"

namespace {

using namespace Tarnik;
using Fuzz::BytesOf;
using Fuzz::SecondsOf;
using Fuzz::TextOf;

constexpr char kPassphrase[] = "secret";
constexpr long kMaxIterations = 2048;

std::string DerOf(const X509* certificate) {
  unsigned char* bytes = nullptr;
  const int length = i2d_X509(certificate, &bytes);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  return {reinterpret_cast<const char*>(bytes), static_cast<std::size_t>(std::max(length, 0))};
}

std::string DerOf(const Crypto::Certificate& certificate) {
  return {reinterpret_cast<const char*>(certificate.DerBytes()), certificate.DerLength()};
}

OpenSsl::OwnedBio Memory(std::string_view text) {
  return OpenSsl::OwnedBio(
      BIO_new_mem_buf(text.empty() ? "" : text.data(), static_cast<int>(text.size())));
}

// Deriving a key from a passphrase takes as long as the input says, which nobody limits.

bool IsAffordable(const ASN1_INTEGER* count) {
  const long value = count == nullptr ? 1 : ASN1_INTEGER_get(count);
  return value >= 0 && value <= kMaxIterations;
}

bool IsAffordable(const X509_ALGOR* algorithm) {
  const ASN1_OBJECT* object = nullptr;
  int type = 0;
  const void* parameter = nullptr;
  X509_ALGOR_get0(&object, &type, &parameter, algorithm);
  if (type != V_ASN1_SEQUENCE) {
    return true;
  }
  const auto* sequence = static_cast<const ASN1_STRING*>(parameter);
  if (OBJ_obj2nid(object) != NID_pbes2) {
    const OpenSsl::Owned<PBEPARAM, PBEPARAM_free> simple(
        static_cast<PBEPARAM*>(ASN1_item_unpack(sequence, ASN1_ITEM_rptr(PBEPARAM))));
    return simple == nullptr || IsAffordable(simple->iter);
  }
  const OpenSsl::Owned<PBE2PARAM, PBE2PARAM_free> scheme(
      static_cast<PBE2PARAM*>(ASN1_item_unpack(sequence, ASN1_ITEM_rptr(PBE2PARAM))));
  if (scheme == nullptr) {
    return true;
  }
  if (OBJ_obj2nid(scheme->keyfunc->algorithm) != NID_id_pbkdf2) {
    return false;
  }
  const OpenSsl::Owned<PBKDF2PARAM, PBKDF2PARAM_free> derivation(static_cast<PBKDF2PARAM*>(
      ASN1_TYPE_unpack_sequence(ASN1_ITEM_rptr(PBKDF2PARAM), scheme->keyfunc->parameter)));
  return derivation == nullptr || IsAffordable(derivation->iter);
}

bool AreAffordable(const STACK_OF(PKCS12_SAFEBAG) * bags) {
  for (int i = 0; i < sk_PKCS12_SAFEBAG_num(bags); ++i) {
    const PKCS12_SAFEBAG* bag = sk_PKCS12_SAFEBAG_value(bags, i);
    const X509_ALGOR* algorithm = nullptr;
    if (PKCS12_SAFEBAG_get_nid(bag) == NID_pkcs8ShroudedKeyBag) {
      X509_SIG_get0(PKCS12_SAFEBAG_get0_pkcs8(bag), &algorithm, nullptr);
    }
    if ((algorithm != nullptr && !IsAffordable(algorithm)) ||
        (PKCS12_SAFEBAG_get_nid(bag) == NID_safeContentsBag &&
         !AreAffordable(PKCS12_SAFEBAG_get0_safes(bag)))) {
      return false;
    }
  }
  return true;
}

void FreeBags(STACK_OF(PKCS12_SAFEBAG) * bags) {
  sk_PKCS12_SAFEBAG_pop_free(bags, PKCS12_SAFEBAG_free);
}
void FreeSafes(STACK_OF(PKCS7) * safes) {
  sk_PKCS7_pop_free(safes, PKCS7_free);
}

bool IsAffordable(PKCS7* safe) {
  if (PKCS7_type_is_data(safe)) {
    const OpenSsl::Owned<STACK_OF(PKCS12_SAFEBAG), FreeBags> bags(PKCS12_unpack_p7data(safe));
    return AreAffordable(bags.get());
  }
  return !PKCS7_type_is_encrypted(safe) || safe->d.encrypted->enc_data->algorithm == nullptr ||
         IsAffordable(safe->d.encrypted->enc_data->algorithm);
}

bool IsAffordable(PKCS12* pkcs12) {
  const ASN1_INTEGER* count = nullptr;
  PKCS12_get0_mac(nullptr, nullptr, nullptr, &count, pkcs12);
  const OpenSsl::Owned<STACK_OF(PKCS7), FreeSafes> safes(PKCS12_unpack_authsafes(pkcs12));
  for (int i = 0; i < sk_PKCS7_num(safes.get()); ++i) {
    if (!IsAffordable(sk_PKCS7_value(safes.get(), i))) {
      return false;
    }
  }
  return IsAffordable(count);
}

// The blocks of a PEM text.

struct Block {
  std::string label;
  std::string bytes;
};

/// Nothing if a block is broken.
std::optional<std::vector<Block>> BlocksOf(std::string_view text) {
  const OpenSsl::OwnedBio source = Memory(text);
  std::vector<Block> blocks;
  for (;;) {
    char* label = nullptr;
    char* header = nullptr;
    unsigned char* bytes = nullptr;
    long length = 0;
    const bool isRead = PEM_read_bio(source.get(), &label, &header, &bytes, &length) == 1;
    const OpenSsl::OwnedMemory<char> labelOwner(label);
    const OpenSsl::OwnedMemory<char> headerOwner(header);
    const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
    if (!isRead) {
      const bool isEnd = ERR_GET_REASON(ERR_peek_last_error()) == PEM_R_NO_START_LINE;
      ERR_clear_error();
      return isEnd ? std::optional(blocks) : std::nullopt;
    }
    blocks.push_back({label, {reinterpret_cast<char*>(bytes), static_cast<std::size_t>(length)}});
  }
}

// Certificates.

void Compare(const Crypto::Certificate& ours, std::string_view bytes) {
  const unsigned char* position = BytesOf(bytes);
  const OpenSsl::OwnedCertificate theirs(
      d2i_X509(nullptr, &position, static_cast<long>(bytes.size())));
  Fuzz::Require(theirs != nullptr && position == BytesOf(bytes) + bytes.size());
  Fuzz::Require(DerOf(ours) == bytes);
  Fuzz::Require(ours.SubjectName() == TextOf(X509_get_subject_name(theirs.get())));
  Fuzz::Require(ours.IssuerName() == TextOf(X509_get_issuer_name(theirs.get())));
  constexpr long kSecond = 1'000'000;
  Fuzz::Require(ours.NotBefore().GetUtcTime() ==
                SecondsOf(X509_get0_notBefore(theirs.get())) * kSecond);
  Fuzz::Require(ours.NotAfter().GetUtcTime() ==
                SecondsOf(X509_get0_notAfter(theirs.get())) * kSecond);
  const OpenSsl::OwnedBigNumber serial(
      ASN1_INTEGER_to_BN(X509_get0_serialNumber(theirs.get()), nullptr));
  const OpenSsl::OwnedMemory<char> decimal(BN_bn2dec(serial.get()));
  Fuzz::Require(ours.SerialNumber() == decimal.get());
}

bool IsCertificate(const Block& block) {
  return block.label == PEM_STRING_X509;
}

void LoadCertificates(std::string_view text) {
  std::vector<Ref<const Crypto::Certificate>> ours;
  try {
    ours = Crypto::CreateCertificatesFromPem(text);
  } catch (const Crypto::CryptoException&) {
    return;
  }
  auto blocks = BlocksOf(text);
  Fuzz::Require(blocks.has_value());
  std::erase_if(*blocks, [](const Block& block) { return !IsCertificate(block); });
  Fuzz::Require(blocks->size() == ours.size());
  for (std::size_t i = 0; i < ours.size(); ++i) {
    Compare(*ours[i], (*blocks)[i].bytes);
  }
}

void LoadDer(std::string_view bytes) {
  try {
    Compare(*Crypto::CreateCertificateFromDer(BytesOf(bytes), bytes.size()), bytes);
  } catch (const Crypto::CryptoException&) {
  }
}

// Revocation lists.

void LoadLists(std::string_view text) {
  std::vector<Ref<const Crypto::RevocationList>> ours;
  try {
    ours = Crypto::CreateRevocationListsFromPem(text);
  } catch (const Crypto::CryptoException&) {
  }
  auto blocks = BlocksOf(text);
  if (blocks) {
    std::erase_if(*blocks, [](const Block& block) { return block.label != PEM_STRING_X509_CRL; });
  }
  const bool areUsable = blocks && !blocks->empty() &&
                         std::all_of(blocks->begin(), blocks->end(), [](const Block& block) {
                           return Fuzz::ReadUsableList(block.bytes) != nullptr;
                         });
  Fuzz::Require(ours.size() == (areUsable ? blocks->size() : 0));
  for (std::size_t i = 0; i < ours.size(); ++i) {
    Fuzz::CompareList(*ours[i], (*blocks)[i].bytes);
  }
}

void LoadList(std::string_view bytes) {
  Ref<const Crypto::RevocationList> ours;
  try {
    ours = Crypto::CreateRevocationListFromDer(BytesOf(bytes), bytes.size());
  } catch (const Crypto::CryptoException&) {
  }
  Fuzz::Require((ours != nullptr) == (Fuzz::ReadUsableList(bytes) != nullptr));
  if (ours != nullptr) {
    Fuzz::CompareList(*ours, bytes);
  }
}

// Private keys.

int AnswerPassphrase(char* buffer, int size, int /*forWriting*/, void* /*data*/) {
  const std::string_view answer = kPassphrase;
  Fuzz::Require(static_cast<std::size_t>(size) >= answer.size());
  std::copy(answer.begin(), answer.end(), buffer);
  return static_cast<int>(answer.size());
}

EVP_PKEY* HandleOf(const Crypto::PrivateKey& key) {
  return dynamic_cast<const Crypto::PrivateKeyImpl&>(key).Handle();
}

bool IsAffordableKey(const Block& block) {
  const unsigned char* position = BytesOf(block.bytes);
  const OpenSsl::Owned<X509_SIG, X509_SIG_free> encrypted(
      d2i_X509_SIG(nullptr, &position, static_cast<long>(block.bytes.size())));
  const X509_ALGOR* algorithm = nullptr;
  if (encrypted != nullptr) {
    X509_SIG_get0(encrypted.get(), &algorithm, nullptr);
  }
  return algorithm == nullptr || IsAffordable(algorithm);
}

bool IsKey(const Block& block) {
  return std::string_view(block.label).ends_with("PRIVATE KEY");
}

// Whether only a reason of OpenSSL's can refuse the text.
bool HasOneSupportedKey(const std::vector<Block>& blocks) {
  const auto first = std::find_if(blocks.begin(), blocks.end(), IsKey);
  return std::count_if(blocks.begin(), blocks.end(), IsKey) == 1 &&
         (first->label == PEM_STRING_PKCS8INF || first->label == PEM_STRING_PKCS8 ||
          first->label == PEM_STRING_RSA || first->label == PEM_STRING_ECPRIVATEKEY);
}

void LoadKey(std::string_view text) {
  const auto blocks = BlocksOf(text);
  if (blocks && !std::all_of(blocks->begin(), blocks->end(), IsAffordableKey)) {
    return;
  }
  int questions = 0;
  Ref<const Crypto::PrivateKey> ours;
  try {
    ours = Crypto::CreatePrivateKeyFromPem(text, [&] {
      ++questions;
      return std::string(kPassphrase);
    });
  } catch (const Crypto::CryptoException&) {
  }
  Fuzz::Require(questions <= 1);
  const OpenSsl::OwnedBio source = Memory(text);
  const OpenSsl::OwnedKey theirs(
      PEM_read_bio_PrivateKey(source.get(), nullptr, AnswerPassphrase, nullptr));
  ERR_clear_error();
  if (ours != nullptr) {
    Fuzz::Require(blocks && std::count_if(blocks->begin(), blocks->end(), IsKey) == 1);
    Fuzz::Require(theirs != nullptr && EVP_PKEY_eq(HandleOf(*ours), theirs.get()) == 1);
  } else {
    Fuzz::Require(theirs == nullptr || !blocks || !HasOneSupportedKey(*blocks));
  }
}

// PKCS#12.

/// With a MAC that is right, so that changes of the content are read.
std::string WithMac(PKCS12* pkcs12) {
  PKCS12_set_mac(pkcs12, kPassphrase, -1, nullptr, 0, 1, EVP_sha256());
  unsigned char* bytes = nullptr;
  const int length = i2d_PKCS12(pkcs12, &bytes);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  return {reinterpret_cast<const char*>(bytes), static_cast<std::size_t>(std::max(length, 0))};
}

void ComparePkcs12(const std::optional<Crypto::KeyAndCertificate>& ours, const std::string& refusal,
                   PKCS12* pkcs12) {
  EVP_PKEY* key = nullptr;
  X509* certificate = nullptr;
  STACK_OF(X509)* others = nullptr;
  const char* passphrase = PKCS12_verify_mac(pkcs12, nullptr, 0) == 1 ? nullptr
                           : PKCS12_verify_mac(pkcs12, "", 0) == 1    ? ""
                                                                      : kPassphrase;
  const bool isParsed = PKCS12_parse(pkcs12, passphrase, &key, &certificate, &others) == 1;
  const OpenSsl::OwnedKey keyOwner(key);
  const OpenSsl::OwnedCertificate certificateOwner(certificate);
  const OpenSsl::OwnedCertificates othersOwner(others);
  ERR_clear_error();
  if (!ours) {
    Fuzz::Require(!isParsed || key == nullptr || certificate == nullptr ||
                  PKCS12_mac_present(pkcs12) != 1 ||
                  refusal.find("more than one private key") != std::string::npos ||
                  refusal.find("certificate") != std::string::npos);
    return;
  }
  Fuzz::Require(isParsed && PKCS12_mac_present(pkcs12) == 1);
  Fuzz::Require(EVP_PKEY_eq(HandleOf(*ours->privateKey), key) == 1);
  Fuzz::Require(DerOf(*ours->certificate) == DerOf(certificate));
  Fuzz::Require(static_cast<int>(ours->chain.size()) == std::max(sk_X509_num(others), 0));
  for (int i = 0; i < sk_X509_num(others); ++i) {
    Fuzz::Require(DerOf(*ours->chain[static_cast<std::size_t>(i)]) ==
                  DerOf(sk_X509_value(others, i)));
  }
}

void LoadPkcs12(std::string bytes, bool withMac) {
  const unsigned char* position = BytesOf(bytes);
  const OpenSsl::OwnedPkcs12 pkcs12(
      d2i_PKCS12(nullptr, &position, static_cast<long>(bytes.size())));
  ERR_clear_error();
  if (pkcs12 != nullptr && !IsAffordable(pkcs12.get())) {
    return;
  }
  if (pkcs12 != nullptr && withMac) {
    bytes = WithMac(pkcs12.get());
  }
  std::optional<Crypto::KeyAndCertificate> ours;
  std::string refusal;
  try {
    ours = Crypto::CreateKeyAndCertificateFromPkcs12(BytesOf(bytes), bytes.size(),
                                                     [] { return std::string(kPassphrase); });
  } catch (const Crypto::CryptoException& error) {
    refusal = error.Message();
  }
  Fuzz::Require(!ours || pkcs12 != nullptr);
  if (pkcs12 != nullptr) {
    ComparePkcs12(ours, refusal, pkcs12.get());
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  if (size == 0) {
    return 0;
  }
  Fuzz::FixRandomness(size);
  const std::string content = Fuzz::TextOf(data + 1, size - 1);
  switch (data[0]) {
    case 'c':
      LoadCertificates(content);
      break;
    case 'd':
      LoadDer(content);
      break;
    case 'k':
      LoadKey(content);
      break;
    case 'p':
      LoadPkcs12(content, false);
      break;
    case 'm':
      LoadPkcs12(content, true);
      break;
    case 'r':
      LoadLists(content);
      break;
    case 'l':
      LoadList(content);
      break;
    case 's':
      LoadList(Fuzz::SignedList(content));
      break;
    default:
      break;
  }
  // OpenSSL's errors of one load must not be taken for those of the next.
  Fuzz::Require(ERR_peek_error() == 0);
  return 0;
}
