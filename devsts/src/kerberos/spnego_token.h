#ifndef DEVSTS_KERBEROS_SPNEGO_TOKEN_H
#define DEVSTS_KERBEROS_SPNEGO_TOKEN_H

#include <stdexcept>

#include "xml/schema_values.h"

// The parts of SPNEGO messages (RFC 4178, section 4.2) that the service reads and writes itself;
// the GSSAPI library handles the rest.
namespace DevSts {

// The octets are not a valid message.
class SpnegoError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

enum class NegState : unsigned char {
  AcceptCompleted = 0,
  AcceptIncomplete = 1,
};

// The encoded list of mechanisms in a client's first leg, which a mechListMIC signs. Throws
// SpnegoError.
Octets MechTypesIn(const Octets& firstLeg);

// The NegTokenResp with its state replaced and a mechListMIC added. It must have a state. Throws
// SpnegoError.
Octets WithMic(const Octets& response, NegState state, const Octets& mic);

// The mechListMIC of a NegTokenResp, empty if it is absent. Throws SpnegoError.
Octets MicIn(const Octets& response);

// A NegTokenResp that contains only a state.
Octets WriteResponse(NegState state);

}  // namespace DevSts

#endif
