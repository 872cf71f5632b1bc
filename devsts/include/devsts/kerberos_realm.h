#ifndef DEVSTS_KERBEROS_REALM_H
#define DEVSTS_KERBEROS_REALM_H

#include <sys/types.h>

#include <chrono>
#include <memory>
#include <string>

namespace DevSts {

/// A Kerberos realm of its own on loopback: database, keys and configuration in a temporary folder,
/// and a running KDC (MIT's krb5kdc). Ends with this object, KDC and folder included. Needs no
/// root.
///
/// A process is a part of the realm when its environment variable KRB5_CONFIG names `ConfigPath`.
/// Used by one thread at a time.
class KerberosRealm {
 public:
  static constexpr const char* kName = "EXAMPLE.COM";

  /// Throws `std::runtime_error`, with what the tools wrote, when the realm cannot be set up.
  KerberosRealm();
  ~KerberosRealm();
  KerberosRealm(const KerberosRealm&) = delete;
  KerberosRealm& operator=(const KerberosRealm&) = delete;

  const std::string& Folder() const;
  const std::string& ConfigPath() const;
  /// The KDC's process; -1 while none runs.
  pid_t KdcProcess() const;

  /// Adds a user with a password.
  void AddUser(const std::string& name, const std::string& password);
  /// Adds a principal with a key that nobody knows and returns the path of a keytab with it.
  std::string AddKeytab(const std::string& principal);
  /// Gets a ticket of the user's and returns the name of a credential cache with it, such as the
  /// environment variable KRB5CCNAME holds.
  std::string Login(const std::string& name, const std::string& password,
                    std::chrono::seconds lifetime = std::chrono::minutes(10));
  /// Starts the KDC anew with a clock that goes wrong by `offset`, for the calls that follow as
  /// well: with a clock an hour slow, `Login` gets tickets that have long expired.
  void SetClock(std::chrono::seconds offset);
  /// Ends the KDC: nobody answers from then on.
  void StopKdc();

 private:
  class State;
  std::unique_ptr<State> state_;
};

}  // namespace DevSts

#endif
