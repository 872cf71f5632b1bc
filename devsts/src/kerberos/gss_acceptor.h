#ifndef DEVSTS_KERBEROS_GSS_ACCEPTOR_H
#define DEVSTS_KERBEROS_GSS_ACCEPTOR_H

#include <memory>
#include <string>

#include "kerberos/gss_library.h"
#include "xml/schema_values.h"

namespace DevSts {

// A service's credentials: the keys of a keytab, for Kerberos inside SPNEGO.
class GssAcceptor {
 public:
  // Throws GssError if the keytab cannot be read or has no key.
  explicit GssAcceptor(const std::string& keytab);

  gss_cred_id_t Credential() const { return credential_.Get(); }

 private:
  GssCredentialHandle credential_;
};

// One login. May be used on any thread, but by one thread at a time. Each call throws GssError.
class GssLogin {
 public:
  explicit GssLogin(std::shared_ptr<const GssAcceptor> acceptor) : acceptor_(std::move(acceptor)) {}

  // Takes the client's next leg and returns the service's, which may be empty at the end.
  Octets Take(const Octets& leg);
  bool IsDone() const { return done_; }

  // The principal that has logged in.
  std::string Principal() const;
  void VerifyMic(const Octets& message, const Octets& mic) const;
  Octets MicOf(const Octets& message) const;

 private:
  std::shared_ptr<const GssAcceptor> acceptor_;
  GssContextHandle context_;
  GssNameHandle client_;
  bool done_ = false;
};

}  // namespace DevSts

#endif
