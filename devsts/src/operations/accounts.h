#ifndef DEVSTS_OPERATIONS_ACCOUNTS_H
#define DEVSTS_OPERATIONS_ACCOUNTS_H

#include <mutex>
#include <string>
#include <utility>

#include "devsts/users.h"

namespace DevSts {

// Who may ask for tokens. Safe on any thread.
class Accounts {
 public:
  explicit Accounts(Users users);

  void Set(Users users);
  // Throws std::out_of_range for an unknown user, std::runtime_error for no certificate.
  void AddCertificate(const std::string& name, const std::string& certificatePem);

  // Throws Fault.
  User Authenticate(const std::string& name, const std::string& password) const;
  // The user who has this certificate, with the name. Throws Fault.
  std::pair<std::string, User> OwnerOf(const std::string& certificatePem) const;
  bool Has(const std::string& name) const;
  // A user of no properties if there is none of this name.
  User Find(const std::string& name) const;

 private:
  mutable std::mutex mutex_;
  Users users_;
};

}  // namespace DevSts

#endif
