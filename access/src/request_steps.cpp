#include <exception>
#include <string>
#include <utility>
#include <variant>

#include <ssoclient/exceptions.h>

#include "core.h"
#include "section.h"
#include "step.h"

namespace SsoClient::Access {

namespace {

// The result of the function is constructed in the secret. Empty when the function throws.
Secret FetchSecret(const PasswordLogin& login, Failure& failure) {
  try {
    return Secret{login.password()};
  } catch (...) {
    failure = Failure::Current();
  }
  return Secret{};
}

bool IsSameCertificate(const Tarnik::Crypto::Certificate& a, const Tarnik::Crypto::Certificate& b) {
  const auto bytes = [](const Tarnik::Crypto::Certificate& certificate) {
    return std::basic_string_view(certificate.DerBytes(), certificate.DerLength());
  };
  return bytes(a) == bytes(b);
}

void Normalise(AttemptOutcome& outcome) {
  if (outcome.token != nullptr || outcome.failure != nullptr) {
    return;
  }
  outcome.message = "The service answered with an empty token.";
  outcome.failure = std::make_exception_ptr(SsoException(outcome.message));
  outcome.kind = FailureKind::kBadToken;
}

}  // namespace

// Throws when there is no worker.
void Core::Run(const RequestPtr& request) {
  runtime_->Run([self = shared_from_this(), request] { self->Work(request); });
}

void Core::StartWork(const RequestPtr& request) noexcept {
  try {
    Run(request);
  } catch (...) {
    FailHere(request, Failure::Current());
  }
}

void Core::FailHere(const RequestPtr& request, const Failure& failure) noexcept {
  Section section(*this);
  if (!request->hasEnded) {
    Fail(section, request, failure, FailureKind::kLocal, runtime_->Now());
  }
}

void Core::Work(const RequestPtr& request) noexcept {
  const ActivityScope scope(*activity_);
  try {
    while (RunStep(request)) {
    }
  } catch (...) {
    FailHere(request, Failure::Current());
  }
}

// Returns whether another step follows at once.
bool Core::RunStep(const RequestPtr& request) {
  static const std::string kNoSecret;
  Step step;
  if (!Begin(request, step)) {
    return false;
  }
  if (step.operation == AttemptOperation::kExchange && step.base == nullptr) {
    RequestBase(request);
    return false;
  }
  const bool needsPassword = step.operation == AttemptOperation::kLogin &&
                             std::holds_alternative<PasswordLogin>(config_->login);
  return needsPassword ? RunLogin(request, step) : RunAttempt(request, step, kNoSecret);
}

bool Core::Begin(const RequestPtr& request, Step& step) {
  Section section(*this);
  if (request->hasEnded) {
    return false;
  }
  const EntryPtr entry = cache_.Peek(SpecView(*request->key));
  if (request->mayRenew && entry != nullptr && !entry->Life().HasEnded(runtime_->Now()) &&
      IsRenewable(*entry->Token())) {
    step.operation = AttemptOperation::kRenewal;
    step.base = entry->Token();
    return true;
  }
  if (std::holds_alternative<TokenLogin>(config_->login)) {
    step.operation = AttemptOperation::kExchange;
    step.base = request->base;
    request->stage = "the token to exchange";
    return true;
  }
  request->stage = "the login's function";
  return true;
}

bool Core::IsRenewable(const SamlToken& token) const {
  if (!config_->holderOfKey || !token.IsRenewable() ||
      token.ConfirmationType() != TokenConfirmationType::HOLDER_OF_KEY) {
    return false;
  }
  const auto certificate = token.HolderOfKeyCertificate();
  return certificate != nullptr &&
         IsSameCertificate(*certificate, *config_->holderOfKey->certificate);
}

void Core::RequestBase(const RequestPtr& request) {
  const auto& login = std::get<TokenLogin>(config_->login);
  CallContext context;
  context.cancellation = request->cancellation.Token();
  login.source->GetTokenAsync(
      login.spec, context,
      [self = shared_from_this(), request](const std::shared_ptr<const SamlToken>& token,
                                           const Tarnik::Exception* failure) {
        self->ReceiveBase(request, token, failure);
      });
}

void Core::ReceiveBase(const RequestPtr& request, const std::shared_ptr<const SamlToken>& token,
                       const Tarnik::Exception* failure) {
  Section section(*this);
  if (request->hasEnded) {
    return;
  }
  if (failure != nullptr) {
    Fail(section, request, Failure::Copy(*failure), Classify(*failure), runtime_->Now());
    return;
  }
  if (token == nullptr) {
    const SsoException empty("The source of the token to exchange has returned none.");
    Fail(section, request, Failure::Copy(empty), FailureKind::kLocal, runtime_->Now());
    return;
  }
  request->base = token;
  section.Start(request);
}

bool Core::RunLogin(const RequestPtr& request, Step& step) {
  Failure failure;
  const Secret secret = FetchSecret(std::get<PasswordLogin>(config_->login), failure);
  if (!failure.IsSet() && secret.text.empty()) {
    failure = Failure::Of(
        Tarnik::InvalidArgumentException("The login's function has returned an empty password."));
  }
  if (failure.IsSet()) {
    Section section(*this);
    if (!request->hasEnded) {
      Fail(section, request, failure, FailureKind::kSecretFailed, runtime_->Now());
    }
    return false;
  }
  step.tag = tagger_.TagOf(secret.text);
  return RunAttempt(request, step, secret.text);
}

bool Core::RunAttempt(const RequestPtr& request, Step& step, const std::string& secret) {
  if (!Admit(request, step)) {
    return false;
  }
  if (config_->listener != nullptr) {
    config_->listener->OnAttemptBegun(step.record);
  }
  return Conclude(request, step, Perform(step, *request, secret));
}

AttemptOutcome Core::Perform(const Step& step, const Request& request, const std::string& secret) {
  AttemptOutcome outcome;
  try {
    outcome = endpoints_.Client(step.endpoint)
                  .Attempt({step.operation, request.key->spec, step.base, secret}, *step.limit);
    Normalise(outcome);
  } catch (...) {
    outcome = {};
    outcome.failure = std::current_exception();
    outcome.kind = FailureKind::kLocal;
    outcome.message = Failure(outcome.failure).Message();
  }
  return outcome;
}

// False when the request has ended or has to wait.
bool Core::Admit(const RequestPtr& request, Step& step) {
  Section section(*this);
  const Instant now = runtime_->Now();
  if (request->hasEnded || !MayLogIn(section, request, step, now)) {
    return false;
  }
  step.order = OrderFor(*request, now);
  const EndpointSet::Admission admission = endpoints_.Admit(request->asked, now.steady, step.order);
  section.Circuit(admission.change);
  if (!admission.endpoint) {
    LeaveGate(section, request, LoginVerdict::kUndecided, {}, now);
    EndRound(section, request, now);
    return false;
  }
  step.endpoint = *admission.endpoint;
  step.begun = now.steady;
  step.limit = Tarnik::Http::CreateCallLimit(now.steady + config_->retry.attemptTimeout);
  request->limit = step.limit;
  request->stage = "the answer of " + endpoints_.Url(step.endpoint);
  const EntryPtr entry = cache_.Peek(SpecView(*request->key));
  step.record.source = config_->name;
  step.record.id = ++lastAttemptId_;
  step.record.endpoint = endpoints_.Url(step.endpoint);
  step.record.operation = step.operation;
  step.record.isRefresh = request->isBackground && entry != nullptr &&
                          entry->Life().IsUsable(now, std::chrono::seconds(0));
  step.record.number = ++request->attempts;
  return true;
}

// A refresh returns to the first endpoint when a failure there does no harm: it is the first
// attempt to refresh the token, nobody waits, and the token outlasts it.
EndpointSet::Order Core::OrderFor(const Request& request, const Instant& now) {
  const RefreshSchedule::Item* item = schedule_.Find(request.key);
  const EntryPtr entry = cache_.Peek(SpecView(*request.key));
  const bool isHarmless =
      request.isBackground && request.undecided == 0 && request.waiters.empty() &&
      entry != nullptr && item != nullptr && item->failures == 0 &&
      entry->Life().usableUntil.steady - now.steady > config_->retry.attemptTimeout;
  return isHarmless ? EndpointSet::Order::kAsListed : EndpointSet::Order::kPreferredFirst;
}

bool Core::MayLogIn(Section& section, const RequestPtr& request, const Step& step,
                    const Instant& now) {
  const bool isLogin = step.operation == AttemptOperation::kLogin;
  if (request->gate && (!isLogin || *request->gate != step.tag)) {
    section.Start(gate_.Withdraw(request));
    request->gate.reset();
  }
  const Failure refusal = RememberedRefusal(request, step, now);
  if (refusal.IsSet()) {
    counters_.refusedFromMemory.Add(std::max<std::size_t>(request->waiters.size(), 1));
    Fail(section, request, refusal, refusal.Kind(), now);
    return false;
  }
  if (!isLogin) {
    return true;
  }
  const bool mayLogIn = gate_.Enter(step.tag, request, now.steady);
  request->gate = step.tag;
  if (!mayLogIn) {
    request->stage = "the login of another call";
  }
  return mayLogIn;
}

Failure Core::RememberedRefusal(const RequestPtr& request, const Step& step, const Instant& now) {
  switch (step.operation) {
    case AttemptOperation::kLogin:
      return gate_.RefusalOf(step.tag, now.steady);
    case AttemptOperation::kExchange: {
      const auto found = refusedExchanges_.find(request->key);
      const bool isKnown = found != refusedExchanges_.end() && now.steady < found->second.until;
      return isKnown ? found->second.failure : Failure();
    }
    case AttemptOperation::kRenewal:
      break;
  }
  return {};
}

void Core::LeaveGate(Section& section, const RequestPtr& request, LoginVerdict verdict,
                     const Failure& refusal, const Instant& now) {
  if (request->gate) {
    section.Start(gate_.Leave(*request->gate, request, verdict, refusal, now.steady));
    request->gate.reset();
  }
}

}  // namespace SsoClient::Access
