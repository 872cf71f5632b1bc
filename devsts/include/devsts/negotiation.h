#ifndef DEVSTS_NEGOTIATION_H
#define DEVSTS_NEGOTIATION_H

#include <chrono>
#include <cstddef>
#include <map>
#include <string>

#include "devsts/misbehavior.h"

namespace DevSts {

/// Logins that are negotiated: Kerberos V5 (RFC 4121) inside SPNEGO (RFC 4178), its legs in
/// wst:BinaryExchange (WS-Trust 1.3, section 8).
struct NegotiationOptions {
  /// The keytab of the service's keys; any of them will do. Empty: a negotiation is refused. The
  /// Kerberos library is configured by the environment variable KRB5_CONFIG, which must be set
  /// before the server is made.
  std::string keytab;
  /// Users by Kerberos principal, "name@REALM". A principal that does not stand here is the user
  /// of the same name, realm included; if there is none, it may not log in.
  std::map<std::string, std::string> principals = {};
  /// Keeps at most this many negotiations that are under way (the oldest are forgotten first).
  std::size_t limit = 1024;
  /// Forgets a negotiation that has not ended this long after it began.
  std::chrono::milliseconds maxAge = std::chrono::minutes(5);
};

/// How the negotiations go that begin from now on.
struct NegotiationScript {
  /// Signs the list of mechanisms and demands that the client does so, too (mechListMIC: RFC 4178,
  /// section 5), as a service does that would have preferred another mechanism: a login that
  /// Kerberos ends with one leg takes a second one. One that takes several anyway stays as it is.
  bool requestMic = false;
  /// So many more legs are asked for when the login is done already. What the client sends in them
  /// is not looked at; the service's own say "accept-incomplete" and nothing else.
  unsigned moreLegs = 0;
  /// The leg of this number, from 1, is answered with `failure`, and the negotiation is forgotten.
  /// 0: none is.
  unsigned failAtLeg = 0;
  FaultAnswer failure{"http://docs.oasis-open.org/ws-sx/ws-trust/200512", "FailedAuthentication",
                      "The negotiation was told to fail", false, 500};
};

}  // namespace DevSts

#endif
