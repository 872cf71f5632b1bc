#ifndef TARNIK_XML_SECURITY_KEY_SELECTION_H
#define TARNIK_XML_SECURITY_KEY_SELECTION_H

#include <cstddef>
#include <vector>

#include <tarnik/core/ref.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "crypto/public_key_impl.h"
#include "crypto/signature_scheme.h"

namespace Tarnik::Xml::Security {

/// No more keys than this are tried for a signature, which limits the work that a message causes.
inline constexpr std::size_t kMaxKeysTried = 16;

/// The trusted keys to verify a signature with.
struct KeySelection {
  std::vector<Ref<const Crypto::PublicKeyImpl>> keys;  ///< not empty
  bool isChoice = false;                               ///< the resolver has several keys
  bool isPartial = false;                              ///< more keys could be tried than may be
};

/// The keys that `resolver` trusts for `keyInfo` and that can verify signatures of `scheme`. Throws
/// `XmlSecurityException` when there is none; exceptions of the resolver pass through.
KeySelection SelectKeys(const KeyInfoResolver& resolver, const KeyInfo& keyInfo,
                        Crypto::SignatureScheme scheme);

/// Throws the `XmlSecurityException` for a signature that none of the keys has made.
[[noreturn]] void RefuseAllKeys(const KeySelection& selection, const KeyInfo& keyInfo);

}  // namespace Tarnik::Xml::Security

#endif
