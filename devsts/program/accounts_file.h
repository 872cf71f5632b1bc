#ifndef DEVSTS_PROGRAM_ACCOUNTS_FILE_H
#define DEVSTS_PROGRAM_ACCOUNTS_FILE_H

#include <map>
#include <string>
#include <vector>

#include "devsts/users.h"

namespace DevSts::Program {

// The users of a service and how they log in with Kerberos.
struct AccountsFile {
  Users users;
  std::vector<std::string> order;                 // of the users in the file
  std::map<std::string, std::string> principals;  // users by principal
  std::map<std::string, unsigned> passwordLines;  // by user
  std::string clientUser;                         // owner of the service's client certificate
  std::string servicePrincipal = "HTTP/localhost";
  std::string keytab;
  std::string userKeytabs;  // the folder that receives a keytab for each user of the realm
  bool startsRealm = false;
};

// Reads a file in the form that AccountsHelp() describes. Throws UsageError, "FILE:LINE: message",
// if a line is wrong, FileError if the file cannot be read.
AccountsFile ReadAccounts(const std::string& path);

// The users of a service without an accounts file.
AccountsFile DemoAccounts();

// Throws UsageError if the realm would misread the name or the password of one of its users.
void RequireRealmUsers(const AccountsFile& accounts, const std::string& path);

// Whether the user belongs to the realm that the program starts.
bool IsInRealm(const std::string& userName);

// Changes a property that does not depend on the file: password, group, given-name, surname,
// solution or password-expired. Returns false if there is no such key; throws std::invalid_argument
// for a wrong value.
bool SetUserProperty(const std::string& key, const std::string& value, User& user);

// Throws std::invalid_argument unless the name has the form name@DOMAIN.
void RequireUserName(const std::string& name);

}  // namespace DevSts::Program

#endif
