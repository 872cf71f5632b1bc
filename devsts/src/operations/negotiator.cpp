#include "operations/negotiator.h"

#include <string_view>
#include <utility>

#include "soap/fault.h"
#include "soap/soap_answer.h"

namespace DevSts {
namespace {

constexpr std::string_view kCookieName = "devsts-negotiation=";

std::shared_ptr<const GssAcceptor> AcceptorFor(const std::string& keytab) {
  return keytab.empty() ? nullptr : std::make_shared<const GssAcceptor>(keytab);
}

// The negotiation identifies the requester.
void RequireNoOtherLogin(const CheckedRequest& request) {
  if (request.header.userNameToken) {
    ThrowInvalidSecurity("A UsernameToken is not expected in a negotiation");
  }
  if (request.proof && request.proof->form == RequestSignature::ByToken) {
    ThrowInvalidSecurity("A signature by a token is not expected in a negotiation");
  }
}

// RFC 6265, sections 4.2.1 and 5.4. Empty if there is no such cookie.
std::string CookieOf(const ReceivedRequest& request) {
  if (request.HeaderCount("Cookie") > 1) {
    ThrowInvalidRequest("Cookie is given more than once");
  }
  const std::string field = request.Header("Cookie");
  std::string_view rest = field;
  while (!rest.empty()) {
    const std::size_t end = rest.find("; ");
    const std::string_view cookie = rest.substr(0, end);
    if (cookie.substr(0, kCookieName.size()) == kCookieName) {
      return std::string(cookie.substr(kCookieName.size()));
    }
    rest.remove_prefix(end != std::string_view::npos ? end + 2 : rest.size());
  }
  return {};
}

std::string SetCookieFor(const std::string& cookie, bool overTls) {
  return std::string(kCookieName) + cookie + "; Path=/; HttpOnly" + (overTls ? "; Secure" : "");
}

ServerLeg AnswerOf(const std::string& context, Octets octets, const LegMisbehavior& misbehavior) {
  ServerLeg leg;
  if (!misbehavior.omitContext) {
    leg.context = misbehavior.context.value_or(context);
  }
  if (misbehavior.leg) {
    leg.octets = Octets(misbehavior.leg->begin(), misbehavior.leg->end());
  } else if (!octets.empty()) {
    leg.octets = std::move(octets);
  }
  if (misbehavior.omitLeg) {
    leg.octets.reset();
  }
  return leg;
}

}  // namespace

Negotiator::Negotiator(const NegotiationOptions& options)
    : acceptor_(AcceptorFor(options.keytab)),
      principals_(options.principals),
      store_(options.limit, options.maxAge) {}

LegReply Negotiator::Begin(CheckedRequest request, IssueRequest issue,
                           const ReceivedRequest& received, const LegMisbehavior& misbehavior,
                           ServiceParts& parts, ReceivedLeg& seen) {
  RequireAcceptor();
  RequireNoOtherLogin(request);
  const NegotiationLeg leg = *issue.leg;
  NegotiationStore::Turn turn = store_.Begin(
      leg.context, {std::move(request), std::move(issue), NegotiatedLogin(acceptor_, Script())});
  const std::string setCookie = SetCookieFor(turn.Cookie(), received.overTls);
  LegReply reply = TakeLeg(std::move(turn), leg.octets, misbehavior, parts, seen);
  if (!misbehavior.omitCookie) {
    reply.setCookie = setCookie;
  }
  return reply;
}

LegReply Negotiator::Continue(const CheckedRequest& request, const ReceivedRequest& received,
                              const LegMisbehavior& misbehavior, ServiceParts& parts,
                              ReceivedLeg& seen) {
  RequireAcceptor();
  if (request.header.userNameToken || request.proof) {
    ThrowInvalidSecurity(
        "Neither a login nor a signature is expected in a later leg of a negotiation");
  }
  NegotiationStore::Turn turn = store_.Resume(seen.context, CookieOf(received));
  turn.Pending().request.now = request.now;
  turn.Pending().request.shape = request.shape;
  const Octets octets(seen.octets.begin(), seen.octets.end());
  return TakeLeg(std::move(turn), octets, misbehavior, parts, seen);
}

LegReply Negotiator::TakeLeg(NegotiationStore::Turn turn, const Octets& octets,
                             const LegMisbehavior& misbehavior, ServiceParts& parts,
                             ReceivedLeg& seen) {
  PendingIssue& pending = turn.Pending();
  NegotiatedLogin& login = pending.login;
  seen.ordinal = login.Legs() + 1;
  const ServerLeg answer = AnswerOf(seen.context, login.Take(octets), misbehavior);
  if (login.IsDone()) {
    const std::string user = UserOf(login.Principal(), parts.accounts);
    return {IssueTo(user, pending.issue, pending.request, parts, answer), {}, true};
  }
  const std::string context = misbehavior.context.value_or(seen.context);
  if (!misbehavior.forget && !context.empty()) {
    turn.Keep(context);
  }
  return {WriteLegEnvelope(answer), {}, false};
}

void Negotiator::RequireAcceptor() const {
  if (acceptor_ == nullptr) {
    ThrowRequestFailed("This service does not negotiate: it has no keytab");
  }
}

std::string Negotiator::UserOf(const std::string& principal, const Accounts& accounts) const {
  const auto mapped = principals_.find(principal);
  const std::string& user = mapped != principals_.end() ? mapped->second : principal;
  if (!accounts.Has(user)) {
    ThrowFailedAuthentication("The principal belongs to no user: " + principal);
  }
  return user;
}

void Negotiator::SetScript(NegotiationScript script) {
  const std::lock_guard lock(mutex_);
  script_ = std::move(script);
}

NegotiationScript Negotiator::Script() const {
  const std::lock_guard lock(mutex_);
  return script_;
}

}  // namespace DevSts
