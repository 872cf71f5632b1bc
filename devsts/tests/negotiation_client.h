#ifndef DEVSTS_NEGOTIATION_CLIENT_H
#define DEVSTS_NEGOTIATION_CLIENT_H

#include <string>

#include "devsts/server.h"
#include "request_text.h"

namespace DevSts::Testing {

inline constexpr char kContinueAction[] =
    "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/Issue";

std::string ToBase64(const std::string& octets);
std::string FromBase64(const std::string& text);

// A wst:BinaryExchange that contains the octets.
std::string Exchange(const std::string& octets);

// The wst:RequestSecurityToken of a negotiation's first leg. `more` is inserted after
// wst:Delegatable.
std::string FirstLegBody(const std::string& context, const std::string& leg,
                         const std::string& keyType = "Bearer", const std::string& more = "");
std::string LaterLegBody(const std::string& context, const std::string& leg);

// The value of the answer's Context attribute, "none" if it is absent.
std::string ContextIn(const std::string& answer);
// The octets of the answer's BinaryExchange, empty if it is absent.
std::string LegIn(const std::string& answer);

// A client's negotiation with the service. Keeps its Context and its cookie.
class NegotiationClient {
 public:
  explicit NegotiationClient(const Server& server);

  // Each returns the whole answer.
  std::string SendFirst(const std::string& leg, const std::string& more = "");
  std::string SendNext(const std::string& leg);
  // Sends a first leg in the given envelope.
  std::string SendFirstEnvelope(const std::string& envelope);

  std::string context;
  std::string cookie;  // as in a Cookie field; if empty, none is sent

 private:
  std::string Send(const std::string& envelope, const std::string& action) const;

  const Server& server_;
};

}  // namespace DevSts::Testing

#endif
