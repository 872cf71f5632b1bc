#include "trust/trust_entry.h"

#include <algorithm>
#include <cstddef>
#include <string_view>
#include <utility>

#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/text/display_text.h>

namespace SsoClient::Access {

namespace {

using Tarnik::Ref;
using Tarnik::Crypto::Certificate;
using Tarnik::Crypto::RevocationList;

constexpr std::size_t kLongestIssuer = 200;

[[noreturn]] void ThrowUnusable(const std::string& path, const std::string& why) {
  throw Tarnik::Crypto::CryptoException("The trust file '" + path + "' cannot be used: " + why);
}

// Returns `decode(content.bytes)`, with the name of the file in exceptions.
template <class Decode>
auto DecodeFile(const FileContent& content, const Decode& decode) {
  try {
    return decode(content.bytes);
  } catch (const Tarnik::Crypto::CryptoException& error) {
    ThrowUnusable(content.path, error.Message());
  }
}

std::vector<Ref<const Certificate>> DecodeCertificates(const FileContent& file) {
  return DecodeFile(file, [](std::string_view bytes) {
    auto certificates = Tarnik::Crypto::CreateCertificatesFromPemOrDer(bytes);
    for (const auto& certificate : certificates) {
      certificate->GetPublicKey();  // throws for a key that no signature could be verified with
    }
    return certificates;
  });
}

// Null if no candidate has signed it.
const Certificate* SignerOf(const RevocationList& list,
                            const std::vector<Ref<const Certificate>>& signers) {
  const auto found = std::find_if(signers.begin(), signers.end(),
                                  [&list](const auto& signer) { return list.IsFrom(*signer); });
  return found == signers.end() ? nullptr : found->get();
}

std::string WhyUnsigned(const RevocationList& list, const TrustContents::Entry& contents) {
  const std::string why = "No certificate of the entry has signed the revocation list of '" +
                          Tarnik::ToDisplayText(list.IssuerName(), kLongestIssuer) + "'.";
  return contents.listSigners.empty() ? why + " The entry has no list signers." : why;
}

}  // namespace

TrustEntry DecodeEntry(const TrustedIssuer& issuer, const TrustContents::Entry& contents) {
  TrustEntry entry;
  entry.issuer = issuer.issuer;
  entry.isRevocationChecked = !issuer.revocationListPaths.empty();
  std::vector<Ref<const Certificate>> listSigners;
  for (const FileContent& file : contents.listSigners) {
    const auto certificates = DecodeCertificates(file);
    listSigners.insert(listSigners.end(), certificates.begin(), certificates.end());
  }
  for (const auto& certificate : issuer.certificates) {
    entry.certificates.push_back({certificate, {}});
    listSigners.push_back(certificate);
  }
  for (const FileContent& file : contents.certificates) {
    for (const auto& certificate : DecodeCertificates(file)) {
      entry.certificates.push_back({certificate, file.path});
      listSigners.push_back(certificate);
    }
  }
  for (const FileContent& file : contents.lists) {
    const auto lists = DecodeFile(file, [](std::string_view bytes) {
      return Tarnik::Crypto::CreateRevocationListsFromPemOrDer(bytes);
    });
    for (const auto& list : lists) {
      const Certificate* const signer = SignerOf(*list, listSigners);
      if (signer == nullptr) {
        ThrowUnusable(file.path, WhyUnsigned(*list, contents));
      }
      entry.lists.push_back({list, Tarnik::Crypto::Fingerprint(*signer)});
    }
  }
  return entry;
}

}  // namespace SsoClient::Access
