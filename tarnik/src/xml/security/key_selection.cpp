#include "xml/security/key_selection.h"

#include <algorithm>
#include <string>
#include <utility>

#include <tarnik/xml/security/xml_security_exception.h>

#include "crypto/key_rules.h"
#include "xml/security/key_check.h"
#include "xml/security/signer_description.h"

namespace Tarnik::Xml::Security {
namespace {

using Crypto::PublicKey;
using Crypto::PublicKeyImpl;
using Crypto::SignatureScheme;
using KeyList = std::vector<Ref<const PublicKey>>;

[[noreturn]] void RefuseKeys(const KeyInfo& keyInfo, const std::string& remark) {
  throw XmlSecurityException("There is no trusted key for the signature, " +
                             DescribeSigner(keyInfo) + remark + ".");
}

KeyList KeysFor(const KeyInfoResolver& resolver, const KeyInfo& keyInfo) {
  KeyList keys;
  if (const auto* several = dynamic_cast<const KeyCandidatesResolver*>(&resolver)) {
    keys = several->Candidates(keyInfo);
    keys.erase(std::remove(keys.begin(), keys.end(), nullptr), keys.end());
  } else if (Ref<const PublicKey> key = resolver.Resolve(keyInfo)) {
    keys.push_back(std::move(key));
  }
  if (keys.empty()) {
    RefuseKeys(keyInfo, "");
  }
  return keys;
}

Ref<const PublicKeyImpl> ImplementationOf(const Ref<const PublicKey>& key) {
  Ref<const PublicKeyImpl> implementation(dynamic_cast<const PublicKeyImpl*>(key.get()));
  if (implementation == nullptr) {
    throw XmlSecurityException("The trusted key was not made by this library.");
  }
  return implementation;
}

// Of keys that cannot be used, a weak one of the right type explains best why.
[[noreturn]] void RefuseUnusable(const KeyList& keys, SignatureScheme scheme) {
  for (const Ref<const PublicKey>& key : keys) {
    const auto* implementation = dynamic_cast<const PublicKeyImpl*>(key.get());
    if (implementation != nullptr && Crypto::IsOfType(*implementation, scheme)) {
      CheckTrustedKey(*implementation, scheme);
    }
  }
  throw XmlSecurityException("No trusted key is of the type of the signature algorithm.");
}

KeySelection SelectUsable(const KeyList& candidates, SignatureScheme scheme) {
  KeySelection selection;
  selection.isChoice = true;
  for (const Ref<const PublicKey>& candidate : candidates) {
    const auto* key = dynamic_cast<const PublicKeyImpl*>(candidate.get());
    if (key == nullptr || !Crypto::IsUsableKey(*key, scheme)) {
      continue;
    }
    if (selection.keys.size() == kMaxKeysTried) {
      selection.isPartial = true;
      break;
    }
    selection.keys.emplace_back(key);
  }
  if (selection.keys.empty()) {
    RefuseUnusable(candidates, scheme);
  }
  return selection;
}

}  // namespace

KeySelection SelectKeys(const KeyInfoResolver& resolver, const KeyInfo& keyInfo,
                        SignatureScheme scheme) {
  const KeyList candidates = KeysFor(resolver, keyInfo);
  if (candidates.size() > 1) {
    return SelectUsable(candidates, scheme);
  }
  KeySelection selection;
  selection.keys.push_back(ImplementationOf(candidates.front()));
  CheckTrustedKey(*selection.keys.front(), scheme);
  return selection;
}

void RefuseAllKeys(const KeySelection& selection, const KeyInfo& keyInfo) {
  RefuseKeys(keyInfo, selection.isPartial ? " (only the first " + std::to_string(kMaxKeysTried) +
                                                " keys of its type were tried)"
                                          : "");
}

}  // namespace Tarnik::Xml::Security
