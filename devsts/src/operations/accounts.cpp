#include "operations/accounts.h"

#include <algorithm>
#include <utility>

#include "devsts/users.h"
#include "operations/secrets.h"
#include "signing/certificates.h"
#include "soap/fault.h"

namespace DevSts {
namespace {

Users WithPlainCertificates(Users users) {
  for (auto& [name, user] : users) {
    for (std::string& certificate : user.certificates) {
      certificate = PlainPem(certificate);
    }
  }
  return users;
}

}  // namespace

Users DemoUsers() {
  return {
      {"alice@EXAMPLE.COM",
       {"secret", false, {"EXAMPLE\\staff", "EXAMPLE\\admins"}, "Alice", "Archer", false}},
      {"bob@EXAMPLE.COM", {"bob-secret", false, {}, "", "", false}},
      {"expired@EXAMPLE.COM", {"expired-secret", true, {}, "Eve", "Expired", false}},
      {"machine@EXAMPLE.COM", {"machine-secret", false, {}, "", "", true}},
  };
}

Accounts::Accounts(Users users) : users_(WithPlainCertificates(std::move(users))) {}

void Accounts::Set(Users users) {
  users = WithPlainCertificates(std::move(users));
  const std::lock_guard lock(mutex_);
  users_ = std::move(users);
}

void Accounts::AddCertificate(const std::string& name, const std::string& certificatePem) {
  std::string pem = PlainPem(certificatePem);
  const std::lock_guard lock(mutex_);
  users_.at(name).certificates.push_back(std::move(pem));
}

User Accounts::Authenticate(const std::string& name, const std::string& password) const {
  const std::lock_guard lock(mutex_);
  const auto found = users_.find(name);
  if (found == users_.end() || found->second.password.empty() ||
      !IsSameSecret(found->second.password, password)) {
    ThrowFailedAuthentication("Invalid credentials");
  }
  if (found->second.passwordExpired) {
    ThrowFailedAuthentication("Password of the user logging on is expired. :: " + name);
  }
  return found->second;
}

std::pair<std::string, User> Accounts::OwnerOf(const std::string& certificatePem) const {
  const std::lock_guard lock(mutex_);
  for (const auto& [name, user] : users_) {
    const auto& known = user.certificates;
    if (std::find(known.begin(), known.end(), certificatePem) != known.end()) {
      return {name, user};
    }
  }
  ThrowFailedAuthentication("The certificate belongs to no user");
}

bool Accounts::Has(const std::string& name) const {
  const std::lock_guard lock(mutex_);
  return users_.count(name) != 0;
}

User Accounts::Find(const std::string& name) const {
  const std::lock_guard lock(mutex_);
  const auto found = users_.find(name);
  if (found == users_.end()) {
    ThrowFailedAuthentication("There is no user " + name);
  }
  return found->second;
}

}  // namespace DevSts
