#ifndef FUZZ_NAMED_SIGNERS_H
#define FUZZ_NAMED_SIGNERS_H

#include <cstddef>
#include <string>
#include <vector>

#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "support/openssl.h"

namespace Fuzz {

struct NamedSigner {
  Tarnik::OpenSsl::OwnedKey key;
  bool isEc = false;
  Tarnik::Ref<const Tarnik::Crypto::Certificate> certificate = {};
};

/// The old and the new RSA key of one subject, a key on each curve, an RSA key that is too short,
/// and two strangers, the first of whom has the subject of the RSA keys.
constexpr std::size_t kStrongSigners = 5;
constexpr std::size_t kTrustedSigners = 6;
constexpr std::size_t kSigners = 8;
const std::vector<NamedSigner>& NamedSigners();

/// What a ds:KeyInfo says about the key. The first kinds select a certificate or a key; the first
/// of them that is present decides.
enum class HintKind {
  kCertificate,
  kIssuerSerial,
  kKeyIdentifier,
  kSubject,
  kSha256,
  kSha384,
  kSha512,
  kKeyValue,
  kEncodedKey,
  kSha1,
  kKeyName,
};
constexpr int kHintKinds = 11;

struct Hint {
  HintKind kind;
  std::size_t named;  ///< the index of the signer that it names
};

/// The element with these hints; empty without a hint.
std::string KeyInfoOf(const std::vector<Hint>& hints);

/// The certificates of these signers, of which the library's resolver trusts each.
struct Trust {
  std::vector<std::size_t> signers;
  /// Whether a signature has to name the issuer of its certificate.
  bool isByIssuer = false;
};
Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> ResolverFor(const Trust& trust);

/// True if a signature with these hints may have been made with the key of `signer`.
bool IsSelected(std::size_t signer, const Trust& trust, const std::vector<Hint>& hints);

}  // namespace Fuzz

#endif
