#include "service.h"

#include <utility>

#include "fault.h"
#include "key_reference.h"
#include "namespaces.h"
#include "request_signature.h"
#include "security_header.h"
#include "soap_answer.h"
#include "soap_request.h"

namespace DevSts {
namespace {

constexpr char kActions[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/";

void RequireFresh(const SecurityHeader& header, Time now, std::chrono::seconds skew) {
  if (header.created > now + skew) {
    ThrowInvalidSecurity("The Timestamp is in the future");
  }
  if (header.expires <= header.created) {
    ThrowInvalidSecurity("The Timestamp expires before it was created");
  }
  if (header.expires <= now - skew) {
    ThrowMessageExpired("The Timestamp has expired");
  }
}

}  // namespace

Service::Service(const ServerOptions& options, Credential signing)
    : parts_{options.clockSkew,
             {options.issuer, options.vendorHost, options.solutionHost, std::move(signing)},
             Accounts(options.users),
             TokenStore(options.issuedTokenLimit)},
      shape_(options.assertion) {}

SoapReply Service::Answer(const ReceivedRequest& request) {
  RequestSignature seen = RequestSignature::None;
  SoapReply reply;
  try {
    reply = Handle(request, seen);
  } catch (const Fault& fault) {
    reply = AnswerFault(fault.Answer());
  } catch (const std::exception& error) {
    reply = AnswerFault(
        {kSoapNamespace, "Server", std::string("The service failed: ") + error.what(), false, 500});
  }
  reply.signature = seen;
  return reply;
}

SoapReply Service::Handle(const ReceivedRequest& received, RequestSignature& seen) {
  const std::string action = ReadSoapAction(received);
  const bool issues = action == std::string(kActions) + "Issue";
  const bool renews = action == std::string(kActions) + "Renew";
  const bool validates = action == std::string(kActions) + "Validate";
  if (!issues && !renews && !validates) {
    ThrowInvalidRequest("Unsupported SOAPAction: " + action);
  }
  CheckedRequest request{ReadEnvelope(received.body), {}, {}, Shape(), Now()};
  request.header = ReadSecurityHeader(request.soap.header);
  seen = SignatureFormOf(request.header);
  RequireFresh(request.header, request.now, parts_.clockSkew);
  request.proof = CheckRequestSignature(request.soap, request.header);

  SoapReply reply;
  reply.holdsToken = !validates;
  if (validates) {
    reply.envelope = Validate(request, parts_);
  } else {
    reply.envelope = renews ? Renew(request, parts_) : Issue(request, parts_);
  }
  return reply;
}

SoapReply Service::AnswerFault(const FaultAnswer& fault) {
  SoapReply reply;
  reply.status = fault.httpStatus;
  reply.envelope = WriteFaultEnvelope(fault);
  reply.faultString = fault.faultString;
  reply.isFault = true;
  return reply;
}

void Service::SetAssertionOptions(AssertionOptions options) {
  const std::lock_guard lock(mutex_);
  shape_ = std::move(options);
}

AssertionOptions Service::Shape() const {
  const std::lock_guard lock(mutex_);
  return shape_;
}

}  // namespace DevSts
