#include "service.h"

#include <openssl/crypto.h>
#include <openssl/rand.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <utility>

#include "act_as.h"
#include "fault.h"
#include "namespaces.h"
#include "openssl_handles.h"
#include "security_header.h"
#include "soap_answer.h"
#include "soap_request.h"

namespace DevSts {
namespace {

constexpr char kIssueAction[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue";

std::string MakeId() {
  std::array<unsigned char, 16> octets{};
  if (RAND_bytes(octets.data(), octets.size()) != 1) {
    ThrowOpenSslError("random ID");
  }
  std::string id = "_";
  for (const unsigned char octet : octets) {
    std::array<char, 3> hex{};
    std::snprintf(hex.data(), hex.size(), "%02x", octet);
    id += hex.data();
  }
  return id;
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

// WS-Trust 1.3, section 11, InvalidTimeRange.
void RequireSensibleLifetime(const IssueRequest& request, Time now, std::chrono::seconds skew) {
  if (request.expires <= request.created) {
    throw Fault(kTrustNamespace, "InvalidTimeRange", "The Lifetime is not positive");
  }
  if (request.created > now + skew) {
    throw Fault(kTrustNamespace, "InvalidTimeRange", "The Lifetime begins in the future");
  }
}

bool IsPrincipalName(const std::string& name) {
  const std::size_t at = name.rfind('@');
  return at != std::string::npos && at != 0 && at + 1 != name.size();
}

bool Equal(const std::string& left, const std::string& right) {
  return left.size() == right.size() && CRYPTO_memcmp(left.data(), right.data(), left.size()) == 0;
}

TokenContent ContentFor(const IssueRequest& request, const AssertionOptions& shape, Time now) {
  TokenContent content;
  content.id = MakeId();
  content.issued = now;
  content.notBefore = now - shape.notBeforeOffset;
  const auto longest = std::chrono::duration_cast<std::chrono::milliseconds>(shape.maxLifetime);
  content.notOnOrAfter = now + std::min(request.expires - request.created, longest);
  content.renewable = request.renewable;
  content.delegable = request.delegable;
  content.audiences = request.audiences;
  content.advice = request.advice;
  return content;
}

}  // namespace

Service::Service(const ServerOptions& options, Credential signing)
    : clockSkew_(options.clockSkew),
      identity_{options.issuer, options.vendorHost, options.solutionHost, std::move(signing)},
      users_(options.users),
      shape_(options.assertion) {}

SoapReply Service::Answer(const ReceivedRequest& request) const {
  try {
    const std::string action = ReadSoapAction(request);
    if (action == kIssueAction) {
      return {200, Issue(request), {}, false};
    }
    ThrowInvalidRequest("Unsupported SOAPAction: " + action);
  } catch (const Fault& fault) {
    return AnswerFault(fault.Answer());
  } catch (const std::exception& error) {
    return AnswerFault(
        {kSoapNamespace, "Server", std::string("The service failed: ") + error.what(), false, 500});
  }
}

SoapReply Service::AnswerFault(const FaultAnswer& fault) {
  return {fault.httpStatus, WriteFaultEnvelope(fault), fault.faultString, true};
}

void Service::SetUsers(Users users) {
  const std::lock_guard lock(mutex_);
  users_ = std::move(users);
}

void Service::SetAssertionOptions(AssertionOptions options) {
  const std::lock_guard lock(mutex_);
  shape_ = std::move(options);
}

AssertionOptions Service::Shape() const {
  const std::lock_guard lock(mutex_);
  return shape_;
}

User Service::Authenticate(const std::string& name, const std::string& password) const {
  const std::lock_guard lock(mutex_);
  const auto found = users_.find(name);
  if (found == users_.end() || !Equal(found->second.password, password)) {
    ThrowFailedAuthentication("Invalid credentials");
  }
  if (found->second.passwordExpired) {
    ThrowFailedAuthentication("Password of the user logging on is expired. :: " + name);
  }
  return found->second;
}

std::string Service::Issue(const ReceivedRequest& received) const {
  const Time now = Now();
  const SoapRequest soap = ReadEnvelope(received.body);
  const SecurityHeader header = ReadSecurityHeader(soap.header);
  RequireFresh(header, now, clockSkew_);
  const IssueRequest request = ReadIssueRequest(soap.bodyEntry, identity_.vendorHost);
  RequireSensibleLifetime(request, now, clockSkew_);
  const User user = Authenticate(header.userName, header.password);
  if (request.publicKey) {
    ThrowInvalidRequest("PublicKey tokens are not issued to unsigned requests");
  }

  const AssertionOptions shape = Shape();
  TokenContent content = ContentFor(request, shape, now);
  content.issuer = identity_.issuer;
  content.subject = header.userName;
  content.user = user;
  if (request.actAs != nullptr) {
    ActAs(request.actAs, header.userName, identity_.signing.certificatePem, content);
    const std::lock_guard lock(mutex_);
    const auto subject = users_.find(content.subject);
    content.user = subject != users_.end() ? subject->second : User();
  }
  if (request.delegateTo) {
    if (!IsPrincipalName(*request.delegateTo)) {
      ThrowInvalidRequest("DelegateTo is not a user principal name: " + *request.delegateTo);
    }
    content.delegates.push_back({*request.delegateTo, now});
  }
  return IssueToken(content, shape, identity_);
}

}  // namespace DevSts
