#include "operations/service.h"

#include <array>
#include <utility>

#include "operations/validate.h"
#include "soap/binary_exchange.h"
#include "soap/fault.h"
#include "soap/key_reference.h"
#include "soap/request_signature.h"
#include "soap/security_header.h"
#include "soap/soap_answer.h"
#include "soap/soap_request.h"
#include "xml/namespaces.h"

namespace DevSts {
namespace {

constexpr char kActions[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/";

enum class Operation { Issue, Continue, Renew, Validate };

Operation OperationOf(const std::string& action) {
  const std::string actions = kActions;
  const std::array<std::pair<const char*, Operation>, 4> operations{{
      {"RST/Issue", Operation::Issue},
      {"RSTR/Issue", Operation::Continue},
      {"RST/Renew", Operation::Renew},
      {"RST/Validate", Operation::Validate},
  }};
  for (const auto& [name, operation] : operations) {
    if (action == actions + name) {
      return operation;
    }
  }
  ThrowInvalidRequest("Unsupported SOAPAction: " + action);
}

SoapReply TokenReply(std::string envelope) {
  SoapReply reply;
  reply.envelope = std::move(envelope);
  reply.holdsToken = true;
  return reply;
}

SoapReply ReplyOf(LegReply leg) {
  SoapReply reply;
  reply.envelope = std::move(leg.envelope);
  reply.holdsToken = leg.holdsToken;
  if (!leg.setCookie.empty()) {
    reply.setCookies.push_back(std::move(leg.setCookie));
  }
  return reply;
}

ReceivedLeg SeenLeg(const NegotiationLeg& leg) {
  return {leg.context, 0, std::string(leg.octets.begin(), leg.octets.end())};
}

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
      negotiator_(options.negotiation),
      shape_(options.assertion) {}

SoapReply Service::Answer(const ReceivedRequest& request, const LegMisbehavior& misbehavior,
                          Time now) {
  Seen seen;
  SoapReply reply;
  try {
    reply = Handle(request, misbehavior, now, seen);
  } catch (const Fault& fault) {
    reply = AnswerFault(fault.Answer());
  } catch (const std::exception& error) {
    reply = AnswerFault(
        {kSoapNamespace, "Server", std::string("The service failed: ") + error.what(), false, 500});
  }
  reply.signature = seen.signature;
  reply.leg = std::move(seen.leg);
  return reply;
}

SoapReply Service::Handle(const ReceivedRequest& received, const LegMisbehavior& misbehavior,
                          Time now, Seen& seen) {
  const Operation operation = OperationOf(ReadSoapAction(received));
  const bool continues = operation == Operation::Continue;
  CheckedRequest request = Check(
      received, continues ? "RequestSecurityTokenResponse" : "RequestSecurityToken", now, seen);
  if (operation == Operation::Issue) {
    return AnswerIssue(std::move(request), received, misbehavior, seen);
  }
  if (continues) {
    return AnswerContinued(request, received, misbehavior, seen);
  }
  if (operation == Operation::Renew) {
    return TokenReply(Renew(request, parts_));
  }
  SoapReply reply;
  reply.envelope = Validate(request, parts_);
  return reply;
}

CheckedRequest Service::Check(const ReceivedRequest& received, const char* entryName, Time now,
                              Seen& seen) const {
  CheckedRequest request{ReadEnvelope(received.body, entryName), {}, {}, Shape(), now};
  request.header = ReadSecurityHeader(request.soap.header);
  seen.signature = SignatureFormOf(request.header);
  RequireFresh(request.header, request.now, parts_.clockSkew);
  request.proof = CheckRequestSignature(request.soap, request.header);
  return request;
}

SoapReply Service::AnswerIssue(CheckedRequest request, const ReceivedRequest& received,
                               const LegMisbehavior& misbehavior, Seen& seen) {
  IssueRequest issue = PrepareIssue(request, parts_);
  if (!issue.leg) {
    return TokenReply(Issue(issue, request, parts_));
  }
  seen.leg = SeenLeg(*issue.leg);
  return ReplyOf(negotiator_.Begin(std::move(request), std::move(issue), received, misbehavior,
                                   parts_, *seen.leg));
}

SoapReply Service::AnswerContinued(const CheckedRequest& request, const ReceivedRequest& received,
                                   const LegMisbehavior& misbehavior, Seen& seen) {
  seen.leg = SeenLeg(ReadContinuedLeg(request.soap.bodyEntry));
  return ReplyOf(negotiator_.Continue(request, received, misbehavior, parts_, *seen.leg));
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
