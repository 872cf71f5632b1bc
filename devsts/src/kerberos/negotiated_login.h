#ifndef DEVSTS_KERBEROS_NEGOTIATED_LOGIN_H
#define DEVSTS_KERBEROS_NEGOTIATED_LOGIN_H

#include <memory>
#include <string>

#include "devsts/negotiation.h"
#include "kerberos/gss_acceptor.h"
#include "xml/schema_values.h"

namespace DevSts {

// The legs of one login according to the script. May be used on any thread, but by one thread at
// a time.
class NegotiatedLogin {
 public:
  NegotiatedLogin(std::shared_ptr<const GssAcceptor> acceptor, NegotiationScript script)
      : login_(std::move(acceptor)), script_(std::move(script)) {}

  // Takes the client's next leg and returns the service's, which may be empty at the end. Throws
  // Fault.
  Octets Take(const Octets& leg);
  bool IsDone() const { return stage_ == Stage::Done; }
  unsigned Legs() const { return legs_; }

  // The principal that has logged in.
  std::string Principal() const { return login_.Principal(); }

 private:
  enum class Stage { Mechanism, Signature, More, Done };

  Octets TakeByStage(const Octets& leg);
  Octets TakeMechanismLeg(const Octets& leg);
  Octets TakeSignature(const Octets& leg);
  Octets TakeMore();
  void EndLogin();

  GssLogin login_;
  NegotiationScript script_;
  Stage stage_ = Stage::Mechanism;
  unsigned legs_ = 0;
  unsigned moreTaken_ = 0;
  Octets mechTypes_;
};

}  // namespace DevSts

#endif
