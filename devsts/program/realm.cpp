#include "realm.h"

#include <chrono>
#include <cstdlib>

#include <unistd.h>

#include "files.h"
#include "value_forms.h"

namespace DevSts::Program {

StartedRealm::StartedRealm(const AccountsFile& accounts)
    : keytab_(realm_.AddKeytab(accounts.servicePrincipal)), service_(accounts.servicePrincipal) {
  // The form of a host-based service (RFC 1964, section 2.1.2).
  service_[service_.find('/')] = '@';
  AddUsers(accounts);
  setenv("KRB5_CONFIG", realm_.ConfigPath().c_str(), 1);
}

void StartedRealm::AddUsers(const AccountsFile& accounts) {
  const std::string scratch = realm_.Folder() + "/user.keytab";
  if (!accounts.userKeytabs.empty()) {
    MakeFolder(accounts.userKeytabs);
  }
  for (const std::string& userName : accounts.order) {
    const User& user = accounts.users.at(userName);
    if (!IsInRealm(userName) || user.password.empty() || user.passwordExpired) {
      continue;
    }
    const std::string name = userName.substr(0, userName.find('@'));
    realm_.AddUser(name, user.password);
    if (cache_.empty()) {
      cache_ = realm_.Login(name, user.password, std::chrono::hours(8));
    }
    if (!accounts.userKeytabs.empty()) {
      realm_.WriteKeytab(name, scratch);
      WriteWhole(accounts.userKeytabs + "/" + name + ".keytab", ReadWhole(scratch),
                 Readers::OwnerOnly);
      unlink(scratch.c_str());
    }
  }
}

std::string StartedRealm::Lines() const {
  std::string lines = "krb5_config=" + ShellWord(realm_.ConfigPath()) + "\n";
  if (!cache_.empty()) {
    lines += "krb5_cache=" + ShellWord(cache_) + "\n";
  }
  return lines + "service=" + ShellWord(service_) + "\n";
}

}  // namespace DevSts::Program
