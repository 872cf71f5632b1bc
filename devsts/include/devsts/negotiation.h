#ifndef DEVSTS_NEGOTIATION_H
#define DEVSTS_NEGOTIATION_H

#include <chrono>
#include <cstddef>
#include <map>
#include <string>

#include "devsts/misbehavior.h"

namespace DevSts {

/// Negotiated logins: Kerberos V5 (RFC 4121) inside SPNEGO (RFC 4178), with the legs in
/// wst:BinaryExchange (WS-Trust 1.3, section 8).
struct NegotiationOptions {
  /// The keytab with the service's keys, each of which is accepted. If empty, negotiations are
  /// refused. The environment variable KRB5_CONFIG configures the Kerberos library and must be set
  /// before the server is constructed.
  std::string keytab;
  /// Users by Kerberos principal, "name@REALM". A principal that is not in this map logs in as the
  /// user of the same name, realm included; if there is no such user, it may not log in.
  std::map<std::string, std::string> principals = {};
  /// Keeps at most this many negotiations in progress (the oldest are forgotten first).
  std::size_t limit = 1024;
  /// Forgets a negotiation that has not ended this long after it began.
  std::chrono::milliseconds maxAge = std::chrono::minutes(5);
};

/// The course of the negotiations that begin from now on.
struct NegotiationScript {
  /// Signs the list of mechanisms and requires that the client signs it too (mechListMIC: RFC 4178,
  /// section 5), like a service that prefers another mechanism. A login that Kerberos completes
  /// with one leg then takes a second one; a login that already takes several legs is unchanged.
  bool requestMic = false;
  /// Asks for this many more legs after the login is complete. The content of the client's legs is
  /// ignored; the service's contain only "accept-incomplete".
  unsigned moreLegs = 0;
  /// Answers the leg with this number, counted from 1, with `failure` and forgets the negotiation.
  /// If it is 0, no leg fails.
  unsigned failAtLeg = 0;
  FaultAnswer failure{"http://docs.oasis-open.org/ws-sx/ws-trust/200512", "FailedAuthentication",
                      "The negotiation is configured to fail", false, 500};
};

}  // namespace DevSts

#endif
