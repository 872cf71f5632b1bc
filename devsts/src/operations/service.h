#ifndef DEVSTS_OPERATIONS_SERVICE_H
#define DEVSTS_OPERATIONS_SERVICE_H

#include <mutex>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "devsts/server.h"
#include "operations/negotiator.h"
#include "operations/operations.h"

namespace DevSts {

// The service's answer to a request, before any misbehaviour is applied.
struct SoapReply {
  int status = 200;
  std::string envelope;
  std::string faultString;  // if it is a fault
  bool isFault = false;
  bool holdsToken = false;
  std::vector<std::string> setCookies;
  // The signature form and the negotiation leg that were found in the request.
  RequestSignature signature = RequestSignature::None;
  std::optional<ReceivedLeg> leg;
};

// The service without the network: it turns requests into envelopes. Thread-safe.
class Service {
 public:
  // Throws GssError if the keytab of the options has no key.
  Service(const ServerOptions& options, Credential signing);

  // `misbehavior` applies to the legs of negotiations, at this time.
  SoapReply Answer(const ReceivedRequest& request, const LegMisbehavior& misbehavior, Time now);
  static SoapReply AnswerFault(const FaultAnswer& fault);

  void SetUsers(Users users) { parts_.accounts.Set(std::move(users)); }
  void RegisterCertificate(const std::string& userName, const std::string& certificatePem) {
    parts_.accounts.AddCertificate(userName, certificatePem);
  }
  bool Revoke(const std::string& assertionId) { return parts_.tokens.Revoke(assertionId); }
  void SetAssertionOptions(AssertionOptions options);
  void SetNegotiationScript(NegotiationScript script) { negotiator_.SetScript(std::move(script)); }
  std::size_t OpenNegotiations() const { return negotiator_.Open(); }

 private:
  // The properties found in a request, even if it is refused.
  struct Seen {
    RequestSignature signature = RequestSignature::None;
    std::optional<ReceivedLeg> leg;
  };

  SoapReply Handle(const ReceivedRequest& request, const LegMisbehavior& misbehavior, Time now,
                   Seen& seen);
  CheckedRequest Check(const ReceivedRequest& request, const char* entryName, Time now,
                       Seen& seen) const;
  SoapReply AnswerIssue(CheckedRequest request, const ReceivedRequest& received,
                        const LegMisbehavior& misbehavior, Seen& seen);
  SoapReply AnswerContinued(const CheckedRequest& request, const ReceivedRequest& received,
                            const LegMisbehavior& misbehavior, Seen& seen);
  AssertionOptions Shape() const;

  ServiceParts parts_;
  Negotiator negotiator_;
  mutable std::mutex mutex_;
  AssertionOptions shape_;
};

}  // namespace DevSts

#endif
