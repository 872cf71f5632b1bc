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

// wst:BinaryExchange around octets.
std::string Exchange(const std::string& octets);

// wst:RequestSecurityToken of a negotiation's first leg. `more` stands behind wst:Delegatable.
std::string FirstLegBody(const std::string& context, const std::string& leg,
                         const std::string& keyType = "Bearer", const std::string& more = "");
std::string LaterLegBody(const std::string& context, const std::string& leg);

// The value of the answer's Context attribute, "none" if there is none.
std::string ContextIn(const std::string& answer);
// The octets of the answer's BinaryExchange, empty if there is none.
std::string LegIn(const std::string& answer);

// One client's negotiation with the service, which keeps its Context and its cookie.
class NegotiationClient {
 public:
  explicit NegotiationClient(const Server& server);

  // Each gives the whole answer.
  std::string SendFirst(const std::string& leg, const std::string& more = "");
  std::string SendNext(const std::string& leg);
  // A first leg whose envelope was made elsewhere.
  std::string SendFirstEnvelope(const std::string& envelope);

  std::string context;
  std::string cookie;  // as in a Cookie field; empty: none is sent

 private:
  std::string Send(const std::string& envelope, const std::string& action) const;

  const Server& server_;
};

}  // namespace DevSts::Testing

#endif
