#include "revocations.h"

#include <stdexcept>
#include <utility>

#include "errors.h"
#include "files.h"

namespace DevSts::Program {
namespace {

constexpr char kFile[] = "/ca.crl";
constexpr std::chrono::hours kListValidity{365L * 24};

}  // namespace

Revocations::Revocations(Keys keys, const std::string& stateFolder) : keys_(std::move(keys)) {
  const std::string path = stateFolder + kFile;
  if (stateFolder.empty() || !Exists(path)) {
    return;
  }
  const std::string list = ReadOwnWhole(path);
  try {
    for (const char* name : {"signing", "server", "client"}) {
      if (IsRevokedBy(list, CertificateOf(name), keys_.authority.certificatePem)) {
        revoked_.insert(name);
      }
    }
  } catch (const std::runtime_error& error) {
    throw FileError(path + ": " + error.what());
  }
}

void Revocations::WriteTo(const std::string& folder) {
  folders_.push_back(folder);
  WriteWhole(folder + kFile, ListPem(revoked_));
}

void Revocations::Revoke(const std::string& name) {
  if (!IsIssuedBy(CertificateOf(name), keys_.authority.certificatePem)) {
    throw std::invalid_argument("the certificate was not issued by the CA; use --signing-by-ca");
  }
  if (folders_.empty()) {
    throw std::invalid_argument("ca.crl has no folder; use --out or --state");
  }
  std::set<std::string> revoked = revoked_;
  revoked.insert(name);
  const std::string list = ListPem(revoked);
  for (const std::string& folder : folders_) {
    WriteWhole(folder + kFile, list);
  }
  revoked_ = std::move(revoked);
}

const std::string& Revocations::CertificateOf(const std::string& name) const {
  if (name == "signing") {
    return keys_.signing.certificatePem;
  }
  if (name == "server") {
    return keys_.server.certificatePem;
  }
  if (name != "client") {
    throw std::invalid_argument("'" + name + "' is not one of signing, server, client");
  }
  return keys_.client.certificatePem;
}

std::string Revocations::ListPem(const std::set<std::string>& names) const {
  std::vector<std::string> certificates;
  certificates.reserve(names.size());
  for (const std::string& name : names) {
    certificates.push_back(CertificateOf(name));
  }
  return MakeRevocationList(keys_.authority, certificates, kListValidity);
}

}  // namespace DevSts::Program
