#ifndef DEVSTS_WIRE_WIRE_ANSWER_H
#define DEVSTS_WIRE_WIRE_ANSWER_H

#include <cstddef>
#include <ctime>
#include <string>

#include "devsts/misbehavior.h"
#include "operations/service.h"

namespace DevSts {

// The octets of an answer.
struct WireAnswer {
  std::string octets;
  std::size_t headSize = 0;  // of octets, up to the body
  int status = 0;            // 0 for raw octets
  bool closes = false;
};

// Writes the reply with the misbehaviour applied. `keepAlive`: whether the request allows the
// connection to stay open. `now` is the Date of the answer (RFC 9110, section 6.6.1), unless the
// misbehaviour has a Date or a whole answer, or omits it.
WireAnswer MakeWireAnswer(SoapReply reply, const Misbehavior& misbehavior, bool keepAlive,
                          std::time_t now);

}  // namespace DevSts

#endif
