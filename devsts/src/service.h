#ifndef DEVSTS_SERVICE_H
#define DEVSTS_SERVICE_H

#include <mutex>
#include <string>

#include "devsts/server.h"
#include "operations.h"

namespace DevSts {

// What the service says to a request, before any misbehaviour.
struct SoapReply {
  int status = 200;
  std::string envelope;
  std::string faultString;  // of a fault
  bool isFault = false;
  bool holdsToken = false;
  // How the request was seen to be signed.
  RequestSignature signature = RequestSignature::None;
};

// The service itself: requests in, envelopes out, no network. Safe on any thread.
class Service {
 public:
  Service(const ServerOptions& options, Credential signing);

  SoapReply Answer(const ReceivedRequest& request);
  static SoapReply AnswerFault(const FaultAnswer& fault);

  void SetUsers(Users users) { parts_.accounts.Set(std::move(users)); }
  void RegisterCertificate(const std::string& userName, const std::string& certificatePem) {
    parts_.accounts.AddCertificate(userName, certificatePem);
  }
  bool Revoke(const std::string& assertionId) { return parts_.tokens.Revoke(assertionId); }
  void SetAssertionOptions(AssertionOptions options);

 private:
  SoapReply Handle(const ReceivedRequest& request, RequestSignature& seen);
  AssertionOptions Shape() const;

  ServiceParts parts_;
  mutable std::mutex mutex_;
  AssertionOptions shape_;
};

}  // namespace DevSts

#endif
