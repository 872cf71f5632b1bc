#include <climits>

#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/private_key.h>

#include "crypto/load_file.h"
#include "crypto/passphrase.h"
#include "crypto/private_key_impl.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

struct FreeAuthenticatedSafes {
  void operator()(STACK_OF(PKCS7) * safes) const noexcept { sk_PKCS7_pop_free(safes, PKCS7_free); }
};
struct FreeBags {
  void operator()(STACK_OF(PKCS12_SAFEBAG) * bags) const noexcept {
    sk_PKCS12_SAFEBAG_pop_free(bags, PKCS12_SAFEBAG_free);
  }
};
using OwnedSafes = std::unique_ptr<STACK_OF(PKCS7), FreeAuthenticatedSafes>;
using OwnedBags = std::unique_ptr<STACK_OF(PKCS12_SAFEBAG), FreeBags>;

// OpenSSL distinguishes an absent passphrase from an empty one, and there are files with either.
constexpr const char* kAbsent = nullptr;
constexpr const char* kEmpty = "";

OpenSsl::OwnedPkcs12 Decode(const unsigned char* bytes, std::size_t length) {
  const OpenSsl::ErrorScope errors;
  const unsigned char* position = bytes;
  OpenSsl::OwnedPkcs12 pkcs12(bytes == nullptr || length > LONG_MAX
                                  ? nullptr
                                  : d2i_PKCS12(nullptr, &position, static_cast<long>(length)));
  if (pkcs12 == nullptr) {
    throw CryptoException(errors.Describe("The PKCS#12 cannot be decoded"));
  }
  return pkcs12;
}

bool HasMacOf(PKCS12* pkcs12, const char* text, int length) {
  const OpenSsl::ErrorScope errors;
  return PKCS12_verify_mac(pkcs12, text, length) == 1;
}

/// The passphrase that the PKCS#12 is protected with; valid as long as `passphrase`.
const char* FindPassphrase(PKCS12* pkcs12, Passphrase& passphrase) {
  if (PKCS12_mac_present(pkcs12) != 1) {
    throw CryptoException("The PKCS#12 is not protected against changes by a passphrase.");
  }
  if (HasMacOf(pkcs12, kAbsent, 0)) {
    return kAbsent;
  }
  if (HasMacOf(pkcs12, kEmpty, 0)) {
    return kEmpty;
  }
  const std::string& text = passphrase.Get();
  if (text.find('\0') != std::string::npos) {
    throw CryptoException("The passphrase of a PKCS#12 cannot hold a NUL.");
  }
  if (!HasMacOf(pkcs12, text.c_str(), static_cast<int>(text.size()))) {
    throw CryptoException("The passphrase of the PKCS#12 is wrong, or the PKCS#12 is broken.");
  }
  return text.c_str();
}

int CountKeys(const STACK_OF(PKCS12_SAFEBAG) * bags) {
  int count = 0;
  for (int i = 0; i < sk_PKCS12_SAFEBAG_num(bags); ++i) {
    const PKCS12_SAFEBAG* bag = sk_PKCS12_SAFEBAG_value(bags, i);
    const int kind = PKCS12_SAFEBAG_get_nid(bag);
    if (kind == NID_keyBag || kind == NID_pkcs8ShroudedKeyBag) {
      ++count;
    } else if (kind == NID_safeContentsBag) {
      // Bags within bags (RFC 7292, section 4.2.6). OpenSSL limits their depth.
      count += CountKeys(PKCS12_SAFEBAG_get0_safes(bag));
    }
  }
  return count;
}

OwnedBags Unpack(PKCS7* safe, const char* text) {
  if (PKCS7_type_is_data(safe)) {
    return OwnedBags(PKCS12_unpack_p7data(safe));
  }
  if (PKCS7_type_is_encrypted(safe)) {
    return OwnedBags(PKCS12_unpack_p7encdata(safe, text, text == nullptr ? 0 : -1));
  }
  return nullptr;
}

// PKCS12_parse returns the first key and ignores the others.
void RequireOneKey(const PKCS12* pkcs12, const char* text) {
  const OpenSsl::ErrorScope errors;
  const OwnedSafes safes(PKCS12_unpack_authsafes(pkcs12));
  int count = 0;
  for (int i = 0; i < sk_PKCS7_num(safes.get()); ++i) {
    count += CountKeys(Unpack(sk_PKCS7_value(safes.get(), i), text).get());
  }
  if (count > 1) {
    throw CryptoException("The PKCS#12 holds more than one private key.");
  }
}

Ref<const Certificate> ToCertificate(const X509* certificate) {
  const OpenSsl::ErrorScope errors;
  unsigned char* bytes = nullptr;
  const int length = i2d_X509(certificate, &bytes);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  if (length <= 0) {
    throw CryptoException(errors.Describe("A certificate of the PKCS#12 cannot be read"));
  }
  return CreateCertificateFromDer(bytes, static_cast<std::size_t>(length));
}

struct Content {
  OpenSsl::OwnedKey key;
  OpenSsl::OwnedCertificate certificate;
  OpenSsl::OwnedCertificates others;
};

Content Parse(PKCS12* pkcs12, const char* text) {
  const OpenSsl::ErrorScope errors;
  EVP_PKEY* key = nullptr;
  X509* certificate = nullptr;
  STACK_OF(X509)* others = nullptr;
  const int parsed = PKCS12_parse(pkcs12, text, &key, &certificate, &others);
  Content content{OpenSsl::OwnedKey(key), OpenSsl::OwnedCertificate(certificate),
                  OpenSsl::OwnedCertificates(others)};
  if (parsed != 1) {
    throw CryptoException(errors.Describe("The PKCS#12 cannot be read"));
  }
  return content;
}

void RequireKeyAndCertificate(const Content& content) {
  if (content.key == nullptr) {
    throw CryptoException("The PKCS#12 holds no private key.");
  }
  if (content.certificate != nullptr) {
    return;
  }
  if (content.others == nullptr || sk_X509_num(content.others.get()) == 0) {
    throw CryptoException("The PKCS#12 holds no certificate.");
  }
  throw CryptoException("No certificate of the PKCS#12 belongs to its private key.");
}

}  // namespace

KeyAndCertificate CreateKeyAndCertificateFromPkcs12(const unsigned char* bytes, std::size_t length,
                                                    const PassphraseCallback& passphrase) {
  const OpenSsl::OwnedPkcs12 pkcs12 = Decode(bytes, length);
  Passphrase asked(passphrase);
  const char* text = FindPassphrase(pkcs12.get(), asked);
  RequireOneKey(pkcs12.get(), text);
  Content content = Parse(pkcs12.get(), text);
  RequireKeyAndCertificate(content);
  KeyAndCertificate result;
  result.privateKey = MakeRef<const PrivateKeyImpl>(std::move(content.key));
  result.certificate = ToCertificate(content.certificate.get());
  if (content.others != nullptr) {
    for (int i = 0; i < sk_X509_num(content.others.get()); ++i) {
      result.chain.push_back(ToCertificate(sk_X509_value(content.others.get(), i)));
    }
  }
  return result;
}

KeyAndCertificate LoadKeyAndCertificate(const std::string& path,
                                        const PassphraseCallback& passphrase) {
  return LoadFile("PKCS#12", path, passphrase,
                  [](std::string_view content, const PassphraseCallback& observed) {
                    return CreateKeyAndCertificateFromPkcs12(
                        reinterpret_cast<const unsigned char*>(content.data()), content.size(),
                        observed);
                  });
}

}  // namespace Tarnik::Crypto
