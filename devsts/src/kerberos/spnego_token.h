#ifndef DEVSTS_KERBEROS_SPNEGO_TOKEN_H
#define DEVSTS_KERBEROS_SPNEGO_TOKEN_H

#include <stdexcept>

#include "xml/schema_values.h"

// SPNEGO's messages (RFC 4178, section 4.2), as far as a service looks at them that leaves the rest
// to the GSSAPI library.
namespace DevSts {

// The octets are not the message that they should be.
class SpnegoError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

enum class NegState : unsigned char {
  AcceptIncomplete = 1,
};

// The list of mechanisms in a client's first leg, encoded as it stands there: what a mechListMIC
// signs. Throws SpnegoError.
Octets MechTypesIn(const Octets& firstLeg);

// The NegTokenResp, which has a state, with this one and with a mechListMIC. Throws SpnegoError.
Octets WithMic(const Octets& response, NegState state, const Octets& mic);

// The mechListMIC of a NegTokenResp, empty if there is none. Throws SpnegoError.
Octets MicIn(const Octets& response);

// A NegTokenResp with a state alone.
Octets WriteResponse(NegState state);

}  // namespace DevSts

#endif
