#ifndef DEVSTS_OPERATIONS_ACCOUNTS_H
#define DEVSTS_OPERATIONS_ACCOUNTS_H

#include <mutex>
#include <string>
#include <utility>

#include "devsts/users.h"

namespace DevSts {

// The users who may request tokens. Thread-safe.
class Accounts {
 public:
  explicit Accounts(Users users);

  void Set(Users users);
  // Throws std::out_of_range for an unknown user, std::runtime_error if the certificate does not
  // load.
  void AddCertificate(const std::string& name, const std::string& certificatePem);

  // Throws Fault if the password is wrong or has expired.
  User Authenticate(const std::string& name, const std::string& password) const;
  // The name and the account of the user who has this certificate. Throws Fault if no user has it.
  std::pair<std::string, User> OwnerOf(const std::string& certificatePem) const;
  bool Has(const std::string& name) const;
  // Throws Fault if there is no user with this name, who may have been removed.
  User Find(const std::string& name) const;

 private:
  mutable std::mutex mutex_;
  Users users_;
};

}  // namespace DevSts

#endif
