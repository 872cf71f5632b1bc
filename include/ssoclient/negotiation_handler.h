#ifndef SSOCLIENT_NEGOTIATION_HANDLER_H
#define SSOCLIENT_NEGOTIATION_HANDLER_H

#include <memory>
#include <vector>

namespace SsoClient {

/// The caller's side of a negotiated login (SPNego, RFC 4178): the caller's GSS library lives
/// behind it. A handler serves one negotiation at a time, on the thread that runs the operation.
class NegotiationHandler {
 public:
  /// Takes the service's last leg, empty on the first call, and returns the next one to send, which
  /// may be empty but not null. When the service ends the negotiation with a leg of its own, that
  /// one is handed over, too, though nothing is sent after it. What it throws passes through the
  /// operation unchanged; from an asynchronous one only a `Tarnik::Exception` reaches the callback,
  /// and anything else ends the process.
  virtual std::shared_ptr<const std::vector<unsigned char>> Negotiate(
      const std::vector<unsigned char>& serverLeg) = 0;

 protected:
  ~NegotiationHandler() = default;
};

}  // namespace SsoClient

#endif
