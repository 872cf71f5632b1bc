#ifndef DEVSTS_SERVICE_H
#define DEVSTS_SERVICE_H

#include <mutex>
#include <string>

#include "devsts/server.h"
#include "issue_request.h"
#include "token_issuer.h"

namespace DevSts {

// What the service says to a request, before any misbehaviour.
struct SoapReply {
  int status = 200;
  std::string envelope;
  std::string faultString;  // of a fault
  bool isFault = false;
};

// The service itself: requests in, envelopes out, no network. Safe on any thread.
class Service {
 public:
  Service(const ServerOptions& options, Credential signing);

  SoapReply Answer(const ReceivedRequest& request) const;
  static SoapReply AnswerFault(const FaultAnswer& fault);

  void SetUsers(Users users);
  void SetAssertionOptions(AssertionOptions options);

 private:
  std::string Issue(const ReceivedRequest& request) const;
  User Authenticate(const std::string& name, const std::string& password) const;
  AssertionOptions Shape() const;

  const std::chrono::seconds clockSkew_;
  const IssuerIdentity identity_;
  mutable std::mutex mutex_;
  Users users_;
  AssertionOptions shape_;
};

}  // namespace DevSts

#endif
