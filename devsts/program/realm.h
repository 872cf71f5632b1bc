#ifndef DEVSTS_PROGRAM_REALM_H
#define DEVSTS_PROGRAM_REALM_H

#include <string>

#include "accounts_file.h"
#include "devsts/kerberos_realm.h"

namespace DevSts::Program {

// A Kerberos realm with the users of an accounts file whose names belong to it. The environment of
// the process describes it, so it must be made while there is only one thread.
class StartedRealm {
 public:
  // Writes a keytab for each of its users if the accounts name a folder for that. The first of the
  // users in the file has a ticket. Throws std::runtime_error or FileError.
  explicit StartedRealm(const AccountsFile& accounts);

  // The keytab of the service.
  const std::string& Keytab() const { return keytab_; }
  // The lines that a client needs to log in, which a shell can read.
  std::string Lines() const;

 private:
  void AddUsers(const AccountsFile& accounts);

  KerberosRealm realm_;
  std::string keytab_;
  std::string cache_;
  std::string service_;
};

}  // namespace DevSts::Program

#endif
