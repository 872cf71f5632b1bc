#include <algorithm>
#include <tuple>
#include <utility>

#include "operations/operations.h"
#include "operations/validate.h"
#include "soap/fault.h"
#include "soap/presented_token.h"
#include "soap/token_request.h"
#include "xml/namespaces.h"

namespace DevSts {
namespace {

constexpr char kPasswordClass[] =
    "urn:oasis:names:tc:SAML:2.0:ac:classes:PasswordProtectedTransport";
constexpr char kKerberosClass[] = "urn:oasis:names:tc:SAML:2.0:ac:classes:Kerberos";
constexpr char kCertificateClass[] = "urn:oasis:names:tc:SAML:2.0:ac:classes:X509";

// The requester, and how often the token that it presents may be delegated further.
struct Requester {
  std::string name;
  // The delegations that the presented token still allows; empty if the new token is not based on
  // another one.
  std::optional<unsigned> proxyCount;
};

bool IsPrincipalName(const std::string& name) {
  const std::size_t at = name.rfind('@');
  return at != std::string::npos && at != 0 && at + 1 != name.size();
}

void RequireMatchingUseKey(const IssueRequest& request, const KeyProof& proof) {
  if (proof.form == RequestSignature::ByToken) {
    if (request.usesKey) {
      ThrowInvalidRequest("UseKey is not expected in a request made with a token");
    }
    return;
  }
  if (!request.publicKey) {
    ThrowInvalidRequest("A request signed with a certificate must ask for a PublicKey token");
  }
  if (!request.delegateTo && !request.usesKey) {
    ThrowInvalidRequest("UseKey is missing");
  }
  if (request.delegateTo && request.usesKey) {
    ThrowInvalidRequest("UseKey is not expected together with DelegateTo");
  }
}

// WS-Trust 1.3, section 9.2: a token is bound only to a key whose possession has been proved.
void RequireProvenKey(const IssueRequest& request, const std::optional<KeyProof>& proof) {
  if (proof) {
    RequireMatchingUseKey(request, *proof);
    return;
  }
  if (request.publicKey) {
    ThrowInvalidRequest("PublicKey tokens are not issued to unsigned requests");
  }
  if (request.usesKey) {
    ThrowInvalidRequest("UseKey names a signature that does not exist");
  }
}

TokenContent ContentFor(const IssueRequest& request, const CheckedRequest& checked) {
  const AssertionOptions& shape = checked.shape;
  TokenContent content;
  content.id = MakeId();
  content.issued = checked.now;
  content.notBefore = checked.now - shape.notBeforeOffset;
  content.notOnOrAfter = GrantedEnd(checked.now, request.expires - request.created, shape);
  if (request.renewable) {
    content.renewal = RenewRestriction{shape.renewCount, shape.postdatable, shape.renewExpired};
  }
  if (request.publicKey) {
    content.holderCertificatePem = checked.proof->certificatePem;
  }
  content.audiences = request.audiences;
  content.advice = request.advice;
  content.authenticated = checked.now;
  return content;
}

Requester LogOn(TokenContent& content, const CheckedRequest& request, const Accounts& accounts) {
  if (const auto& token = request.header.userNameToken) {
    content.subject = token->userName;
    content.user = accounts.Authenticate(token->userName, token->password);
    content.authenticationClass = kPasswordClass;
    return {content.subject, std::nullopt};
  }
  if (!request.proof) {
    ThrowInvalidSecurity("No UsernameToken and no Signature after the Timestamp");
  }
  std::tie(content.subject, content.user) = accounts.OwnerOf(request.proof->certificatePem);
  content.authenticationClass = kCertificateClass;
  return {content.subject, std::nullopt};
}

Requester UseToken(TokenContent& content, const CheckedRequest& request,
                   const ServiceParts& parts) {
  const std::string place = "The presented token";
  xmlNode* assertion = request.header.assertion;
  const PresentedToken token = ReadPresentedToken(assertion, place);
  const IssuedToken issued = RequireValidToken(
      assertion, token, place, parts.identity.signing.certificatePem, parts.tokens, request.now);
  content.subject = token.subject;
  content.delegates = token.delegates;
  content.user = parts.accounts.Find(token.subject);
  content.authenticated = issued.content.authenticated;
  content.authenticationClass = issued.content.authenticationClass;
  return {token.Bearer(), token.proxyCount};
}

Requester Identify(TokenContent& content, const CheckedRequest& request,
                   const ServiceParts& parts) {
  const bool byToken = request.proof && request.proof->form == RequestSignature::ByToken;
  return byToken ? UseToken(content, request, parts) : LogOn(content, request, parts.accounts);
}

// Replaces the subject by that of the ActAs token (WS-Trust 1.4, section 9.3) and appends the
// requester to its delegation chain.
void ActAs(xmlNode* assertion, Requester& requester, TokenContent& content,
           const CheckedRequest& request, const ServiceParts& parts) {
  const std::string place = "The ActAs token";
  const PresentedToken token = ReadPresentedToken(assertion, place);
  RequireValidToken(assertion, token, place, parts.identity.signing.certificatePem, parts.tokens,
                    request.now);
  content.subject = token.subject;
  content.delegates = token.delegates;
  content.user = parts.accounts.Find(token.subject);
  const bool isDelegate = !token.delegates.empty() && token.Bearer() == requester.name;
  if (!isDelegate && token.proxyCount == 0) {
    ThrowInvalidRequest("The ActAs token may not be delegated to " + requester.name);
  }
  if (!isDelegate) {
    content.delegates.push_back({requester.name, request.now});
  }
  requester.proxyCount = token.proxyCount;
}

// SAML 2.0 Core, section 2.5.1.6: a token that is based on another one may be delegated once less.
void AddProxyRestriction(const Requester& requester, unsigned most, TokenContent& content) {
  if (!requester.proxyCount) {
    content.proxyCount = most;
    return;
  }
  if (*requester.proxyCount == 0) {
    ThrowInvalidRequest("A token that is based on one that is not delegable cannot be delegable");
  }
  content.proxyCount = std::min(most, *requester.proxyCount - 1);
}

void DelegateTo(const std::string& name, const Requester& requester, TokenContent& content) {
  if (!IsPrincipalName(name)) {
    ThrowInvalidRequest("DelegateTo is not a user principal name: " + name);
  }
  if (requester.proxyCount && *requester.proxyCount == 0) {
    ThrowInvalidRequest(
        "A token that is based on one that is not delegable cannot be delegated to " + name);
  }
  content.delegates.push_back({name, content.issued});
}

std::string IssueBy(Requester requester, TokenContent content, const IssueRequest& request,
                    const CheckedRequest& checked, ServiceParts& parts, const ServerLeg& leg) {
  content.issuer = parts.identity.issuer;
  if (request.actAs != nullptr) {
    ActAs(request.actAs, requester, content, checked, parts);
  }
  if (request.delegable) {
    AddProxyRestriction(requester, checked.shape.proxyCount, content);
  }
  if (request.delegateTo) {
    DelegateTo(*request.delegateTo, requester, content);
  }
  return IssueAndRemember(std::move(content), checked, parts, TokenAnswer::Issued, leg);
}

}  // namespace

IssueRequest PrepareIssue(const CheckedRequest& checked, const ServiceParts& parts) {
  IssueRequest request = ReadIssueRequest(checked.soap.bodyEntry, parts.identity.vendorHost);
  RequireSensibleLifetime(request.created, request.expires, checked.now - parts.clockSkew);
  if (request.created > checked.now + parts.clockSkew) {
    ThrowInvalidTimeRange("The Lifetime begins in the future");
  }
  RequireProvenKey(request, checked.proof);
  return request;
}

std::string IssueTo(const std::string& userName, const IssueRequest& request,
                    const CheckedRequest& checked, ServiceParts& parts, const ServerLeg& leg) {
  TokenContent content = ContentFor(request, checked);
  content.subject = userName;
  content.user = parts.accounts.Find(userName);
  content.authenticationClass = kKerberosClass;
  return IssueBy({userName, std::nullopt}, std::move(content), request, checked, parts, leg);
}

std::string Issue(const IssueRequest& request, const CheckedRequest& checked, ServiceParts& parts) {
  TokenContent content = ContentFor(request, checked);
  const Requester requester = Identify(content, checked, parts);
  return IssueBy(requester, std::move(content), request, checked, parts, {});
}

}  // namespace DevSts
