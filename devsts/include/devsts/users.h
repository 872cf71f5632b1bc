#ifndef DEVSTS_USERS_H
#define DEVSTS_USERS_H

#include <map>
#include <string>
#include <vector>

namespace DevSts {

/// An account of the STS.
struct User {
  /// A user with an empty password cannot log in by password.
  std::string password;
  bool passwordExpired = false;
  /// Each in the form "DOMAIN\group".
  std::vector<std::string> groups;
  std::string givenName;
  std::string surname;
  bool isSolution = false;
  /// PEM certificates. The user may request tokens with each of them by proving possession of its
  /// key.
  std::vector<std::string> certificates = {};
};

/// Accounts by user principal name, "user@domain", case-sensitive.
using Users = std::map<std::string, User>;

/// alice@EXAMPLE.COM (password "secret", groups EXAMPLE\staff and EXAMPLE\admins, Alice Archer),
/// bob@EXAMPLE.COM ("bob-secret", no groups and no names), expired@EXAMPLE.COM ("expired-secret",
/// password expired) and the solution user machine@EXAMPLE.COM ("machine-secret").
Users DemoUsers();

}  // namespace DevSts

#endif
