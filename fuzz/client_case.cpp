#include "client_case.h"

#include <algorithm>
#include <cstdio>
#include <iterator>
#include <map>

#include <openssl/x509.h>

#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/private_key.h>

#include "client_pki.h"

namespace Fuzz {
namespace {

using Tarnik::Ref;
using Tarnik::Crypto::Certificate;
using Tarnik::Testing::TemporaryFile;
using Tarnik::Testing::TemporaryFolder;

/// A key that another library made.
class ForeignKey final : public Tarnik::Crypto::PrivateKey, public Tarnik::ObjectImpl {
 public:
  Ref<const Tarnik::Crypto::PublicKey> GetPublicKey() const override { return nullptr; }
  bool Matches(const Certificate& /*certificate*/) const override { return true; }
};

bool Contains(const Words& words, const std::string& word) {
  return std::find(words.begin(), words.end(), word) != words.end();
}

std::string FileContent(const Words& parts) {
  if (parts == Words{"der"}) {
    return DerOfRoot();
  }
  std::string content;
  for (const std::string& part : parts) {
    content += PartOf(part);
  }
  return content;
}

// What is wrong with the content of a PEM file; empty if nothing is.
std::string ContentFault(const Words& parts, bool isForLists) {
  if (Contains(parts, "broken")) {
    return "'";
  }
  const bool isFound = std::any_of(parts.begin(), parts.end(), [&](const std::string& part) {
    return isForLists ? FindList(part) != nullptr : FindCertificate(part) != nullptr;
  });
  if (isFound) {
    return "";
  }
  if (parts == Words{"der"}) {
    return "': it is DER; PEM is expected.";
  }
  return isForLists ? "': it holds no revocation list in PEM."
                    : "': it holds no certificate in PEM.";
}

// The name of a file in a folder of CA certificates, without its number.
std::string HashedName(const std::string& issuer, const char* kind) {
  char name[32];
  const X509* certificate = FindCertificate(issuer)->identity.certificate.get();
  std::snprintf(name, sizeof(name), "%08lx.%s",
                X509_NAME_hash_ex(X509_get_subject_name(certificate), nullptr, nullptr, nullptr),
                kind);
  return name;
}

}  // namespace

bool ClientCase::Take(const Words& line) {
  const std::string& kind = line.front();
  const Words rest(line.begin() + 1, line.end());
  if (kind == "ca-file" || kind == "crl-file") {
    AddFile(rest, kind == "crl-file");
  } else if (kind == "ca-folder") {
    AddFolder(rest);
  } else if (kind == "ca") {
    AddCertificates(rest, "A CA certificate of the SSL context is null.", config_.caCertificates,
                    trusted_);
  } else if (kind == "pin") {
    AddCertificates(rest, "A pinned certificate of the SSL context is null.",
                    config_.pinnedCertificates, pinned_);
  } else if (kind == "client" && !rest.empty()) {
    SetClient(rest.front());
  } else if (kind == "key" && !rest.empty()) {
    SetKey(rest.front());
  } else if (kind == "chain") {
    chain_.insert(chain_.end(), rest.begin(), rest.end());
    for (const std::string& name : rest) {
      const NamedCertificate* certificate = FindCertificate(name);
      if (certificate != nullptr || name == "null") {
        config_.clientCertificateChain.push_back(
            certificate == nullptr ? nullptr : certificate->identity.ToCertificate());
      }
    }
  } else {
    return false;
  }
  return true;
}

std::string ClientCase::Keep(const std::string& content) {
  files_.push_back(std::make_unique<TemporaryFile>(content));
  return files_.back()->Path();
}

void ClientCase::AddFault(bool isArgument, std::string text) {
  faults_.push_back({isArgument, std::move(text)});
}

void ClientCase::AddFile(const Words& parts, bool isForLists) {
  static const TemporaryFolder folder;
  static const std::map<std::string, std::pair<std::string, std::string>> special = {
      {"@missing", {folder.Path() + "/none", folder.Path() + "/none': No such file or directory."}},
      {"@folder", {folder.Path(), folder.Path() + "'"}},
      {"@empty", {"", "': the path is empty or holds a NUL."}},
      {"@nul", {std::string("a\0b", 3), "': the path is empty or holds a NUL."}}};
  const std::string what =
      isForLists ? "Cannot load revocation lists from '" : "Cannot load CA certificates from '";
  auto& paths = isForLists ? config_.crlFiles : config_.caFiles;
  const auto found = parts.size() == 1 ? special.find(parts.front()) : special.end();
  if (found != special.end()) {
    paths.push_back(found->second.first);
    AddFault(false, what + found->second.second);
    return;
  }
  paths.push_back(Keep(FileContent(parts)));
  const std::string fault = ContentFault(parts, isForLists);
  if (!fault.empty()) {
    AddFault(false, what + paths.back() + fault);
  }
  for (const std::string& part : parts) {
    if (!isForLists && FindCertificate(part) != nullptr) {
      trusted_.insert(part);
    }
    if (FindList(part) != nullptr) {
      lists_.insert(part);
    }
  }
}

void ClientCase::AddFolder(const Words& parts) {
  const std::string what = "Cannot load CA certificates from the folder '";
  folders_.push_back(std::make_unique<TemporaryFolder>());
  const TemporaryFolder& folder = *folders_.back();
  const std::string special =
      parts.size() == 1 && parts.front().front() == '@' ? parts.front() : "";
  if (special == "@empty" || special == "@nul") {
    config_.caFolders.push_back(special == "@empty" ? "" : std::string("a\0b", 3));
    AddFault(false, what + "': the path is empty or holds a NUL.");
    return;
  }
  if (special == "@missing" || special == "@file") {
    // A program, since others may not be searched, which is a fault of its own.
    config_.caFolders.push_back(special == "@file" ? "/bin/sh" : folder.Path() + "/none");
    AddFault(false,
             what + config_.caFolders.back() +
                 (special == "@file" ? "': it is not a folder." : "': No such file or directory."));
    return;
  }
  config_.caFolders.push_back(folder.Path());
  std::map<std::string, int> numbers;
  for (const std::string& part : parts) {
    const NamedList* list = FindList(part);
    if (list == nullptr && FindCertificate(part) == nullptr) {
      continue;
    }
    const std::string name = list != nullptr ? HashedName(list->issuer, "r") : HashedName(part, "");
    folder.Write(name + std::to_string(numbers[name]++), PartOf(part));
    (list != nullptr ? lists_ : trusted_).insert(part);
  }
}

void ClientCase::AddCertificates(const Words& names, const char* nullText,
                                 std::vector<Ref<const Certificate>>& certificates,
                                 std::set<std::string>& known) {
  for (const std::string& name : names) {
    if (name == "null") {
      certificates.emplace_back();
      AddFault(true, nullText);
    } else if (const NamedCertificate* certificate = FindCertificate(name)) {
      certificates.push_back(certificate->identity.ToCertificate());
      known.insert(name);
    }
  }
}

void ClientCase::SetClient(const std::string& name) {
  if (const NamedCertificate* certificate = FindCertificate(name)) {
    client_ = name;
    config_.clientCertificate = certificate->identity.ToCertificate();
  }
}

void ClientCase::SetKey(const std::string& name) {
  const NamedCertificate* certificate = FindCertificate(name);
  if (name == "foreign") {
    config_.clientPrivateKey = Tarnik::MakeRef<ForeignKey>();
  } else if (certificate != nullptr) {
    config_.clientPrivateKey = Tarnik::Crypto::CreatePrivateKeyFromPem(KeyOf(*certificate));
  }
  if (name == "foreign" || certificate != nullptr) {
    key_ = name;
  }
}

// In the order of what can be found only if what comes before it is right.
std::vector<ClientCase::Fault> ClientCase::IdentityFaults() const {
  if (client_.empty() && key_.empty()) {
    return config_.clientCertificateChain.empty()
               ? std::vector<Fault>()
               : std::vector<Fault>{{false, "has a client's chain without a client certificate."}};
  }
  if (key_.empty()) {
    return {{false, "has a client certificate without the private key that belongs to it."}};
  }
  if (client_.empty()) {
    return {{false, "has a client's private key without the certificate that belongs to it."}};
  }
  if (key_ == "foreign") {
    return {{false, "The client's private key was not made by this library."}};
  }
  if (key_ != client_) {
    return {{false, "does not belong to the client certificate CN=" + client_ + "."}};
  }
  // Keys that give less than 112 bits of security (RFC 9325, section 4.5).
  if (client_ == "weak") {
    return {{false, "Cannot use the client certificate CN=weak: "}};
  }
  std::vector<Fault> faults;
  for (const std::string& name : chain_) {
    if (name == "null") {
      faults.push_back({true, "A certificate of the client's chain is null."});
    } else if (name == "weak") {
      faults.push_back({false, "Cannot use the certificate CN=weak in the client's chain: "});
    }
  }
  return faults;
}

bool ClientCase::IsRefused() const {
  return !faults_.empty() || !IdentityFaults().empty();
}

bool ClientCase::Explains(bool isArgument, const std::string& message) const {
  std::vector<Fault> all = IdentityFaults();
  all.insert(all.end(), faults_.begin(), faults_.end());
  return std::any_of(all.begin(), all.end(), [&](const Fault& fault) {
    return fault.isArgument == isArgument && message.find(fault.text) != std::string::npos;
  });
}

bool ClientCase::Trusts(const std::string& server, bool isChainSent) const {
  const auto chain = ChainOf(server);
  const bool isComplete = std::all_of(chain.begin() + 1, chain.end(), [&](const auto* each) {
    // Only a self-signed certificate ends a chain, so what the server sends is never an end.
    return trusted_.count(each->name) != 0 || (isChainSent && each->name != each->issuer);
  });
  const bool isStrong = chain.front()->name != "weak" && !chain.front()->isExpired;
  return isComplete && isStrong && (pinned_.empty() || pinned_.count(server) != 0) &&
         (config_.crlFiles.empty() || IsUnrevoked(server));
}

bool ClientCase::IsUnrevoked(const std::string& server) const {
  const auto chain = ChainOf(server);
  return std::all_of(chain.begin(), chain.end(), [&](const NamedCertificate* certificate) {
    bool isListed = false;
    bool isRevoked = false;
    for (const std::string& name : lists_) {
      const NamedList* list = FindList(name);
      isListed = isListed || (list->issuer == certificate->issuer && !list->isOutdated);
      isRevoked = isRevoked || list->revoked == certificate->name;
    }
    return isListed && !isRevoked;
  });
}

std::vector<std::string> ClientCase::Presented() const {
  std::vector<std::string> presented;
  if (!client_.empty()) {
    presented.push_back(client_);
    std::copy_if(chain_.begin(), chain_.end(), std::back_inserter(presented),
                 [](const std::string& name) { return FindCertificate(name) != nullptr; });
  }
  return presented;
}

}  // namespace Fuzz
