#include <cstddef>
#include <string_view>
#include <utility>

#include <tarnik/xml/security/key_hints.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "crypto/public_key_info.h"
#include "xml/security/content_reader.h"

namespace Tarnik::Xml::Security {
namespace {

using Bytes = std::vector<unsigned char>;

constexpr std::string_view kCurvePrefix = "urn:oid:";

template <class List>
bool IsFull(const List& hints) noexcept {
  return hints.size() == KeyHints::kMaxOfEachKind;
}

bool IsNamed(const ElementNode* element, std::string_view namespaceUri,
             std::string_view localName) {
  return element != nullptr && element->NamespaceUri() == namespaceUri &&
         element->LocalName() == localName;
}

std::string_view TextIn(const Bytes& bytes) noexcept {
  return {reinterpret_cast<const char*>(bytes.data()), bytes.size()};
}

// XML Signature 1.1, section 4.5.2.2.
Bytes ReadRsaKeyValue(const ElementNode* element) {
  ContentReader content(element);
  const Bytes modulus = BytesOf(content.Take("Modulus"));
  const Bytes exponent = BytesOf(content.Take("Exponent"));
  content.ExpectEnd();
  return Crypto::RsaPublicKeyInfo(TextIn(modulus), TextIn(exponent));
}

// XML Signature 1.1, section 4.5.2.3.
Bytes ReadEcKeyValue(const ElementNode* element) {
  ContentReader content(element);
  const ElementNode* const curve = content.Peek();
  if (!IsNamed(curve, kDs11Namespace, "NamedCurve")) {
    return {};
  }
  content.TakeAny();
  const std::string uri(curve->FindAttribute("URI").value_or(""));
  const ElementNode* const key = content.Peek();
  if (uri.compare(0, kCurvePrefix.size(), kCurvePrefix) != 0 ||
      !IsNamed(key, kDs11Namespace, "PublicKey")) {
    return {};
  }
  content.TakeAny();
  content.ExpectEnd();
  const Bytes point = BytesOf(key);
  return Crypto::EcPublicKeyInfo(uri.substr(kCurvePrefix.size()), TextIn(point));
}

// Keys of other kinds, such as DSAKeyValue, are skipped.
void ReadKeyValue(const ElementNode* element, KeyHints& hints) {
  const ContentReader content(element);
  const ElementNode* const key = content.Peek();
  if (IsNamed(key, kDsNamespace, "RSAKeyValue")) {
    hints.publicKeys.push_back(ReadRsaKeyValue(key));
  } else if (IsNamed(key, kDs11Namespace, "ECKeyValue")) {
    hints.publicKeys.push_back(ReadEcKeyValue(key));
  }
}

void ReadKey(const ElementNode* element, KeyHints& hints) {
  try {
    if (element->NamespaceUri() == kDsNamespace) {
      ReadKeyValue(element, hints);
    } else {
      hints.publicKeys.push_back(BytesOf(element));
    }
  } catch (const SignatureSyntaxException&) {
    hints.publicKeys.emplace_back();
  }
}

Bytes DigestIn(const ElementNode* element) {
  try {
    return BytesOf(element);
  } catch (const SignatureSyntaxException&) {
    return {};
  }
}

void ReadDigests(const ElementNode* data, KeyHints& hints) {
  for (ContentReader content(data); content.Peek() != nullptr; content.TakeAny()) {
    if (IsFull(hints.certificateDigests)) {
      return;
    }
    const ElementNode* const digest = content.Peek();
    if (IsNamed(digest, kDs11Namespace, "X509Digest")) {
      hints.certificateDigests.push_back(
          {std::string(digest->FindAttribute("Algorithm").value_or("")), DigestIn(digest)});
    }
  }
}

void ReadHint(const ElementNode* element, KeyHints& hints) {
  if (IsNamed(element, kDsNamespace, "KeyValue") ||
      IsNamed(element, kDs11Namespace, "DEREncodedKeyValue")) {
    if (!IsFull(hints.publicKeys)) {
      ReadKey(element, hints);
    }
  } else if (IsNamed(element, kDsNamespace, "X509Data")) {
    ReadDigests(element, hints);
  }
}

}  // namespace

KeyHints ReadKeyHints(const KeyInfo& keyInfo) {
  KeyHints hints;
  if (keyInfo.element == nullptr) {
    return hints;
  }
  try {
    for (ContentReader content(keyInfo.element.get()); content.Peek() != nullptr;) {
      ReadHint(content.TakeAny(), hints);
    }
  } catch (const SignatureSyntaxException&) {
    // Somebody modified the tree after the element was read.
  }
  return hints;
}

}  // namespace Tarnik::Xml::Security
