#ifndef SSOCLIENT_NEGOTIATION_HANDLER_H
#define SSOCLIENT_NEGOTIATION_HANDLER_H

#include <memory>
#include <vector>

namespace SsoClient {

/// The caller's side of a negotiated login (SPNEGO, RFC 4178), usually implemented with a GSS
/// library. A handler serves one negotiation at a time, on the thread that runs the operation.
class NegotiationHandler {
 public:
  /// Receives the service's last leg, empty on the first call, and returns the next leg to send,
  /// which may be empty but not null. When the service ends the negotiation with a leg, the handler
  /// receives that leg too, though nothing is sent after it. Exceptions propagate through the
  /// operation unchanged. In an asynchronous operation, only a `Tarnik::Exception` reaches the
  /// callback; any other exception terminates the process.
  virtual std::shared_ptr<const std::vector<unsigned char>> Negotiate(
      const std::vector<unsigned char>& serverLeg) = 0;

 protected:
  ~NegotiationHandler() = default;
};

}  // namespace SsoClient

#endif
