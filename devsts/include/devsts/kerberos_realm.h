#ifndef DEVSTS_KERBEROS_REALM_H
#define DEVSTS_KERBEROS_REALM_H

#include <chrono>
#include <memory>
#include <string>

#include <sys/types.h>

namespace DevSts {

/// A private Kerberos realm on loopback: database, keys and configuration in a temporary folder,
/// and a running KDC (MIT's krb5kdc). The destructor stops the KDC and removes the folder. Does not
/// need root privileges.
///
/// A process is part of the realm if its environment variable KRB5_CONFIG is `ConfigPath`. An
/// object must be used by one thread at a time.
class KerberosRealm {
 public:
  static constexpr const char* kName = "EXAMPLE.COM";

  /// Throws `std::runtime_error`, with the output of the tools, if the realm cannot be set up.
  KerberosRealm();
  ~KerberosRealm();
  KerberosRealm(const KerberosRealm&) = delete;
  KerberosRealm& operator=(const KerberosRealm&) = delete;

  const std::string& Folder() const;
  const std::string& ConfigPath() const;
  /// The KDC's process ID; -1 while it is not running.
  pid_t KdcProcess() const;

  /// Adds a user with a password.
  void AddUser(const std::string& name, const std::string& password);
  /// Adds a principal with a random key and returns the path of a keytab that contains the key.
  std::string AddKeytab(const std::string& principal);
  /// Writes a keytab with the present keys of a principal, so that a user can log in by password
  /// and by keytab.
  void WriteKeytab(const std::string& principal, const std::string& path);
  /// Acquires a ticket for the user and returns the name of a credential cache that contains it, in
  /// the form of the environment variable KRB5CCNAME.
  std::string Login(const std::string& name, const std::string& password,
                    std::chrono::seconds lifetime = std::chrono::minutes(10));
  /// Restarts the KDC with a clock that is wrong by `offset`, which also applies to the calls that
  /// follow: with a clock that is an hour slow, `Login` acquires tickets that have long expired.
  void SetClock(std::chrono::seconds offset);
  /// Stops the KDC. Requests are no longer answered.
  void StopKdc();

 private:
  class State;
  std::unique_ptr<State> state_;
};

}  // namespace DevSts

#endif
