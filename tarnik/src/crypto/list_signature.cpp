#include "crypto/list_signature.h"

#include <cstddef>
#include <cstdint>
#include <string_view>

#include <openssl/asn1.h>
#include <openssl/objects.h>
#include <openssl/rsa.h>

#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

/// A DER value within other bytes.
struct DerValue {
  const unsigned char* begin;
  const unsigned char* content;
  const unsigned char* end;
  int tag;

  std::string_view Bytes() const noexcept {
    return {reinterpret_cast<const char*>(begin), static_cast<std::size_t>(end - begin)};
  }
};

std::optional<DerValue> ValueAt(const unsigned char* begin, const unsigned char* end) {
  constexpr int kBrokenOrOfNoLength = 0x81;
  const unsigned char* position = begin;
  long length = 0;
  int tag = 0;
  int kind = 0;
  const int result = ASN1_get_object(&position, &length, &tag, &kind, end - begin);
  if ((result & kBrokenOrOfNoLength) != 0) {
    return std::nullopt;
  }
  return DerValue{begin, position, position + length, tag};
}

// The algorithm within the signed part, which follows the version, if there is one.
std::optional<DerValue> AlgorithmIn(const DerValue& signedPart) {
  const auto first = ValueAt(signedPart.content, signedPart.end);
  return first && first->tag == V_ASN1_INTEGER ? ValueAt(first->end, signedPart.end) : first;
}

// None unless the algorithms within and outside of the part are the same (RFC 5280, section
// 5.1.1.2). The bytes as they were received are verified, not those that OpenSSL would write.
std::optional<DerValue> SignedPartOf(const std::vector<unsigned char>& der) {
  const auto whole = ValueAt(der.data(), der.data() + der.size());
  const auto signedPart = whole ? ValueAt(whole->content, whole->end) : std::nullopt;
  const auto outer = signedPart ? ValueAt(signedPart->end, whole->end) : std::nullopt;
  const auto inner = signedPart ? AlgorithmIn(*signedPart) : std::nullopt;
  return outer && inner && outer->Bytes() == inner->Bytes() ? signedPart : std::nullopt;
}

std::optional<Hash> HashOfNumber(int number) noexcept {
  switch (number) {
    case NID_sha256:
      return Hash::kSha256;
    case NID_sha384:
      return Hash::kSha384;
    case NID_sha512:
      return Hash::kSha512;
    default:
      return std::nullopt;
  }
}

std::optional<Hash> HashIn(const X509_ALGOR* algorithm) noexcept {
  const ASN1_OBJECT* identifier = nullptr;
  X509_ALGOR_get0(&identifier, nullptr, nullptr, algorithm);
  return HashOfNumber(OBJ_obj2nid(identifier));
}

/// The parameters of an algorithm, decoded by `Decode`; null unless they are a sequence.
template <auto Decode>
auto ParametersOf(const X509_ALGOR* algorithm) {
  const void* parameters = nullptr;
  int type = V_ASN1_UNDEF;
  X509_ALGOR_get0(nullptr, &type, &parameters, algorithm);
  if (type != V_ASN1_SEQUENCE) {
    return decltype(Decode(nullptr, nullptr, 0))(nullptr);
  }
  const auto* sequence = static_cast<const ASN1_STRING*>(parameters);
  const unsigned char* position = ASN1_STRING_get0_data(sequence);
  return Decode(nullptr, &position, ASN1_STRING_length(sequence));
}

bool IsMaskOf(Hash hash, const X509_ALGOR* mask) {
  const ASN1_OBJECT* identifier = nullptr;
  X509_ALGOR_get0(&identifier, nullptr, nullptr, mask);
  const OpenSsl::Owned<X509_ALGOR, X509_ALGOR_free> maskHash(ParametersOf<d2i_X509_ALGOR>(mask));
  return OBJ_obj2nid(identifier) == NID_mgf1 && maskHash != nullptr &&
         HashIn(maskHash.get()) == hash;
}

bool HasValue(const ASN1_INTEGER* number, std::int64_t value) {
  std::int64_t read = 0;
  return ASN1_INTEGER_get_int64(&read, number) == 1 && read == value;
}

// RFC 4055, section 3.1, with the parameters that `SignatureScheme::kRsaPss` has.
std::optional<Hash> PssHashOf(const X509_ALGOR* algorithm) {
  const OpenSsl::Owned<RSA_PSS_PARAMS, RSA_PSS_PARAMS_free> parameters(
      ParametersOf<d2i_RSA_PSS_PARAMS>(algorithm));
  if (parameters == nullptr || parameters->hashAlgorithm == nullptr ||
      parameters->maskGenAlgorithm == nullptr || parameters->saltLength == nullptr) {
    return std::nullopt;  // a default is SHA-1
  }
  const std::optional<Hash> hash = HashIn(parameters->hashAlgorithm);
  const bool isSupported =
      hash && IsMaskOf(*hash, parameters->maskGenAlgorithm) &&
      HasValue(parameters->saltLength, static_cast<std::int64_t>(HashLength(*hash))) &&
      (parameters->trailerField == nullptr || HasValue(parameters->trailerField, 1));
  return isSupported ? hash : std::nullopt;
}

struct SchemeAndHash {
  SignatureScheme scheme;
  Hash hash;
};

std::optional<SchemeAndHash> AlgorithmOf(const X509_ALGOR* algorithm) {
  const ASN1_OBJECT* identifier = nullptr;
  X509_ALGOR_get0(&identifier, nullptr, nullptr, algorithm);
  int hashNumber = NID_undef;
  int keyNumber = NID_undef;
  if (OBJ_find_sigid_algs(OBJ_obj2nid(identifier), &hashNumber, &keyNumber) != 1) {
    return std::nullopt;
  }
  const std::optional<Hash> hash =
      keyNumber == NID_rsassaPss ? PssHashOf(algorithm) : HashOfNumber(hashNumber);
  if (!hash) {
    return std::nullopt;
  }
  switch (keyNumber) {
    case NID_rsaEncryption:
      return SchemeAndHash{SignatureScheme::kRsaPkcs1, *hash};
    case NID_rsassaPss:
      return SchemeAndHash{SignatureScheme::kRsaPss, *hash};
    case NID_X9_62_id_ecPublicKey:
      return SchemeAndHash{SignatureScheme::kEcdsa, *hash};
    default:
      return std::nullopt;
  }
}

bool IsOfWholeBytes(const ASN1_BIT_STRING* bits) noexcept {
  constexpr long kUnusedBits = 7;
  return (bits->flags & kUnusedBits) == 0;
}

}  // namespace

std::optional<ListSignature> ReadListSignature(const X509_CRL* list,
                                               const std::vector<unsigned char>& der) {
  const OpenSsl::ErrorScope errors;
  const ASN1_BIT_STRING* value = nullptr;
  const X509_ALGOR* algorithm = nullptr;
  X509_CRL_get0_signature(list, &value, &algorithm);
  const auto signedPart = SignedPartOf(der);
  const auto known = AlgorithmOf(algorithm);
  if (!signedPart || !known || !IsOfWholeBytes(value)) {
    return std::nullopt;
  }
  const unsigned char* bytes = ASN1_STRING_get0_data(value);
  const std::string_view part = signedPart->Bytes();
  return ListSignature{HashOf(known->hash, signedPart->begin, part.size()),
                       {bytes, bytes + ASN1_STRING_length(value)},
                       known->scheme,
                       known->hash};
}

}  // namespace Tarnik::Crypto
