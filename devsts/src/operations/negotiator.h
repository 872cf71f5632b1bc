#ifndef DEVSTS_OPERATIONS_NEGOTIATOR_H
#define DEVSTS_OPERATIONS_NEGOTIATOR_H

#include <map>
#include <memory>
#include <mutex>
#include <string>

#include "devsts/negotiation.h"
#include "devsts/server.h"
#include "operations/negotiation_store.h"
#include "operations/operations.h"

namespace DevSts {

// The answer to a leg of a negotiation.
struct LegReply {
  std::string envelope;
  std::string setCookie;  // a Set-Cookie field's value, empty for none
  bool holdsToken = false;
};

// Issues tokens to clients that log in by a negotiation. Thread-safe.
class Negotiator {
 public:
  // Throws GssError if the keytab has no key.
  explicit Negotiator(const NegotiationOptions& options);

  // Both functions set the ordinal of the leg in `seen` and throw Fault.
  LegReply Begin(CheckedRequest request, IssueRequest issue, const ReceivedRequest& received,
                 const LegMisbehavior& misbehavior, ServiceParts& parts, ReceivedLeg& seen);
  LegReply Continue(const CheckedRequest& request, const ReceivedRequest& received,
                    const LegMisbehavior& misbehavior, ServiceParts& parts, ReceivedLeg& seen);

  void SetScript(NegotiationScript script);
  std::size_t Open() const { return store_.Size(); }

 private:
  void RequireAcceptor() const;
  LegReply TakeLeg(NegotiationStore::Turn turn, const Octets& octets,
                   const LegMisbehavior& misbehavior, ServiceParts& parts, ReceivedLeg& seen);
  std::string UserOf(const std::string& principal, const Accounts& accounts) const;
  NegotiationScript Script() const;

  const std::shared_ptr<const GssAcceptor> acceptor_;
  const std::map<std::string, std::string> principals_;
  NegotiationStore store_;
  mutable std::mutex mutex_;
  NegotiationScript script_;
};

}  // namespace DevSts

#endif
