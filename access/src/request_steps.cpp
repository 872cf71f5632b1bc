#include <algorithm>
#include <exception>
#include <string>
#include <utility>
#include <variant>

#include <ssoclient/exceptions.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/text/string_util.h>

#include "core.h"
#include "secret_text.h"
#include "section.h"
#include "step.h"
#include "token_source_impl.h"

namespace SsoClient::Access {

namespace {

// What a token to exchange loses of its life before the answer.
constexpr std::chrono::seconds kTimeOfExchange{5};
constexpr std::chrono::milliseconds kShortestRefresh{1000};
constexpr std::chrono::seconds kLongestBaseLife = std::chrono::hours(24 * 365 * 30);

// The result of the function is constructed in the secret. Empty when the function throws.
Secret FetchSecret(const PasswordLogin& login, Failure& failure) {
  try {
    return Secret{login.password()};
  } catch (...) {
    failure = Failure::Current();
  }
  return Secret{};
}

void Normalise(AttemptOutcome& outcome) {
  if (outcome.token != nullptr || outcome.failure != nullptr) {
    return;
  }
  outcome.message = "The service answered with an empty token.";
  outcome.failure = std::make_exception_ptr(SsoException(outcome.message));
  outcome.kind = FailureKind::kBadToken;
}

// `failure` with another text.
Failure Reworded(const Failure& failure, const std::string& text) {
  if (failure.Is<InvalidCredentialsException>()) {
    return Failure::Of(InvalidCredentialsException(text));
  }
  if (failure.Is<PasswordExpiredException>()) {
    return Failure::Of(PasswordExpiredException(text));
  }
  return failure.Is<CommunicationException>() ? Failure::Of(CommunicationException(text))
                                              : Failure::Of(SsoException(text));
}

// A refresh leaves half of what is left of the token's life to the next attempt.
std::chrono::milliseconds RefreshLimit(const CacheEntry& entry, const Instant& now) {
  const auto half = (entry.Life().usableUntil.steady - now.steady) / 2;
  return std::max(std::chrono::duration_cast<std::chrono::milliseconds>(half), kShortestRefresh);
}

}  // namespace

// Throws when there is no worker.
void Core::Run(const RequestPtr& request) {
  runtime_->Run([self = shared_from_this(), request] { self->Work(request); });
}

void Core::FailHere(const RequestPtr& request, const Failure& failure) noexcept {
  Section section(*this);
  FailUnlessEnded(section, request, failure);
}

void Core::FailUnlessEnded(Section& section, const RequestPtr& request,
                           const Failure& failure) noexcept {
  if (!request->hasEnded) {
    Fail(section, request, failure, runtime_->Now());
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
    request->stage = Stage::kBase;
    return true;
  }
  return !std::holds_alternative<PasswordLogin>(config_->login) || EnterFunction(request);
}

bool Core::IsRenewable(const SamlToken& token) const {
  if (!config_->holderOfKey || !token.IsRenewable() ||
      token.ConfirmationType() != TokenConfirmationType::HOLDER_OF_KEY) {
    return false;
  }
  const auto certificate = token.HolderOfKeyCertificate();
  return certificate != nullptr &&
         Tarnik::Crypto::IsSameCertificate(*certificate, *config_->holderOfKey->certificate);
}

// A token ends with the one that it is exchanged for, which must last for those who wait.
std::chrono::seconds Core::BaseLife(const Request& request) const noexcept {
  std::chrono::seconds life{0};
  for (const WaiterPtr& waiter : request.waiters) {
    life = std::max(life, std::min(waiter->Context().minimumLife, kLongestBaseLife));
  }
  return life == std::chrono::seconds(0) ? life : life + kTimeOfExchange;
}

// Whether those who still wait may be helped by another token to exchange.
bool Core::MayLengthenBase(const Request& request) const noexcept {
  return !request.waiters.empty() && !request.takesAnyBase && BaseLife(request) > request.baseLife;
}

void Core::RequestBase(const RequestPtr& request) {
  const auto& login = std::get<TokenLogin>(config_->login);
  CallContext context;
  context.cancellation = request->cancellation.Token();
  {
    const Section section(*this);
    request->baseLife = request->takesAnyBase ? std::chrono::seconds(0) : BaseLife(*request);
    context.minimumLife = request->baseLife;
  }
  const auto receive = [self = shared_from_this(), request](const Answer& answer) {
    self->ReceiveBase(request, answer);
  };
  // A source of this library knows the exact kind of a failure.
  if (auto* const known = dynamic_cast<TokenSourceImpl*>(login.source.get())) {
    known->GetAnswerAsync(login.spec, context, receive);
    return;
  }
  login.source->GetTokenAsync(
      login.spec, context,
      [receive](const std::shared_ptr<const SamlToken>& token, const Tarnik::Exception* failure) {
        receive({token, failure == nullptr ? Failure() : Failure::Copy(*failure)});
      });
}

void Core::ReceiveBase(const RequestPtr& request, const Answer& answer) noexcept {
  Section section(*this);
  if (request->hasEnded) {
    return;
  }
  if (answer.failure.IsSet() && request->baseLife > std::chrono::seconds(0) &&
      answer.failure.Kind() == FailureKind::kFault) {
    // Those who need less, or the service, may do with a shorter one.
    request->takesAnyBase = true;
    section.Start(request);
    return;
  }
  if (answer.failure.IsSet()) {
    Fail(section, request, answer.failure, runtime_->Now());
    return;
  }
  if (answer.token == nullptr) {
    const Failure empty = Failure::Made([] {
      return Failure::Of(SsoException("The source of the token to exchange has returned none."));
    });
    Fail(section, request, empty.WithKind(FailureKind::kLocal), runtime_->Now());
    return;
  }
  NoteBase(section, answer.token);
  request->base = answer.token;
  section.Start(request);
}

// When this token was first seen. Of the first one, nobody knows how old it is.
void Core::NoteBase(Section& section, const std::shared_ptr<const SamlToken>& token) noexcept {
  if (knownBase_ != nullptr && knownBase_->Id() != token->Id()) {
    knownBaseSince_ = runtime_->Now().steady;
  }
  section.Keep(std::exchange(knownBase_, token));
}

bool Core::RunLogin(const RequestPtr& request, Step& step) {
  Failure failure;
  step.begun = runtime_->Now().steady;
  const Secret secret = FetchSecret(std::get<PasswordLogin>(config_->login), failure);
  {
    Section section(*this);
    ReturnFunction(section);
  }
  if (!failure.IsSet() && secret.text.empty()) {
    failure = Failure::Made([] {
      return Failure::Of(
          Tarnik::InvalidArgumentException("The login's function has returned an empty password."));
    });
  }
  if (failure.IsSet()) {
    FailLogin(request, step, failure.WithKind(FailureKind::kSecretFailed));
    return false;
  }
  step.tag = tagger_.TagOf(secret.text);
  return RunAttempt(request, step, secret.text);
}

// An attempt that has ended before an endpoint was chosen.
void Core::FailLogin(const RequestPtr& request, Step& step, const Failure& failure) {
  AttemptRecord& record = step.record;
  const Instant now = runtime_->Now();
  std::string message = failure.RecordText();
  {
    const Section section(*this);
    record.source = config_->name;
    record.operation = step.operation;
    record.isRefresh = request->isBackground && HasUsableToken(*request, now);
    record.id = ++lastAttemptId_;
    record.number = ++request->attempts;
  }
  ReportBegin(record);
  Section section(*this);
  counters_.CountAttempt(failure.Kind());
  record.duration = std::chrono::duration_cast<std::chrono::microseconds>(now.steady - step.begun);
  record.failure = failure.Kind();
  record.message = std::move(message);
  section.ReportEnd(record);
  if (!request->hasEnded) {
    Fail(section, request, failure, now);
  }
}

bool Core::RunAttempt(const RequestPtr& request, Step& step, const std::string& secret) {
  if (!Admit(request, step)) {
    return false;
  }
  ReportBegin(step.record);
  const bool goesOn = Conclude(request, step, Perform(step, *request, secret));
  if (step.isBaseRefused) {
    InvalidateBase(step);
  }
  return goesOn;
}

void Core::ReportBegin(const AttemptRecord& record) const noexcept {
  if (config_->listener != nullptr) {
    Section::Notify(*config_->listener,
                    [&record](AccessListener& listener) { listener.OnAttemptBegun(record); });
  }
}

Result Core::Perform(const Step& step, const Request& request, const std::string& secret) noexcept {
  Result result;
  AttemptOutcome& outcome = result.outcome;
  try {
    outcome = endpoints_.Client(step.endpoint)
                  .Attempt({step.operation, request.key->spec, step.base, secret}, *step.limit);
    Normalise(outcome);
  } catch (...) {
    outcome = {};
    outcome.failure = std::current_exception();
    outcome.kind = FailureKind::kLocal;
    const Failure failure(outcome.failure);
    result.reason = failure.AsReason();
    result.failure = Failure(outcome.failure, result.reason);
    return result;
  }
  if (outcome.failure != nullptr) {
    result.reason = MakeReason(outcome.kind, outcome.message);
    result.failure = Failure(outcome.failure, result.reason);
    result.refusal = ToRemember(result.failure, secret);
  }
  return result;
}

// A refusal outlives the call that it was the answer to, so it must not contain the password.
Failure Core::ToRemember(const Failure& failure, const std::string& secret) const noexcept {
  const FailureKind kind = failure.Kind();
  if (kind != FailureKind::kRefusedLogin && kind != FailureKind::kExpiredPassword) {
    return {};
  }
  try {
    std::string text = failure.Message();
    const std::string shown = HideSecret(text, secret);
    const bool isSame = shown == text;
    Tarnik::StringUtil::Cleanse(text);
    return isSame ? failure : Reworded(failure, shown).WithKind(kind);
  } catch (const std::bad_alloc&) {
    return kind == FailureKind::kRefusedLogin ? refused_ : expired_;
  }
}

// If it fails, for want of memory or in a source of the program, the next refusal does it.
void Core::InvalidateBase(const Step& step) noexcept {
  try {
    std::get<TokenLogin>(config_->login).source->Invalidate(*step.base);
  } catch (...) {
  }
}

bool Core::HasUsableToken(const Request& request, const Instant& now) {
  const EntryPtr entry = cache_.Peek(SpecView(*request.key));
  return entry != nullptr && entry->Life().IsUsable(now, std::chrono::seconds(0));
}

// False when the request has ended or has to wait.
bool Core::Admit(const RequestPtr& request, Step& step) {
  Section section(*this);
  const Instant now = runtime_->Now();
  if (request->hasEnded || !MayLogIn(section, request, step, now) ||
      !TakePlace(section, request, now)) {
    return false;
  }
  step.endpoint = *request->place;
  step.order = request->order;
  step.begun = now.steady;
  const EntryPtr entry = cache_.Peek(SpecView(*request->key));
  step.record.source = config_->name;
  step.record.endpoint = endpoints_.Url(step.endpoint);
  step.record.operation = step.operation;
  step.record.isRefresh = request->isBackground && HasUsableToken(*request, now);
  const auto limit = config_->retry.attemptTimeout;
  step.limit = Tarnik::Http::CreateCallLimit(
      now.steady + (step.record.isRefresh ? std::min(limit, RefreshLimit(*entry, now)) : limit));
  // From here on nothing fails, and what has begun here is ended by `Conclude`.
  request->place.reset();
  section.Circuit(endpoints_.Begin(step.endpoint, now.steady));
  if (request->gate) {
    gate_.Begin(*request->gate);
    request->sendsPassword = std::holds_alternative<PasswordLogin>(config_->login);
  }
  request->limit = step.limit;
  request->stage = Stage::kAttempt;
  request->endpoint = step.endpoint;
  step.record.id = ++lastAttemptId_;
  step.record.number = ++request->attempts;
  return true;
}

bool Core::MayLogIn(Section& section, const RequestPtr& request, const Step& step,
                    const Instant& now) {
  const bool isLogin = step.operation == AttemptOperation::kLogin;
  if (request->gate && (!isLogin || *request->gate != step.tag)) {
    WithdrawFromGate(section, request);
  }
  const Failure refusal = RememberedRefusal(*request, step, now);
  if (refusal.IsSet()) {
    counters_.refusedFromMemory.Add(std::max<std::size_t>(request->waiters.size(), 1));
    Fail(section, request, refusal, now);
    return false;
  }
  if (!isLogin) {
    return true;
  }
  if (const auto closedUntil = gate_.ClosedUntil(step.tag); now.steady < closedUntil) {
    WithdrawFromGate(section, request);
    ReturnPlace(section, request);
    Pause(section, request, closedUntil);
    return false;
  }
  const bool mayLogIn = gate_.Enter(step.tag, request, now.steady);
  request->gate = step.tag;
  if (!mayLogIn) {
    request->stage = Stage::kGate;
    // The one that has the gate may need it.
    ReturnPlace(section, request);
  }
  return mayLogIn;
}

Failure Core::RememberedRefusal(const Request& request, const Step& step,
                                const Instant& now) const {
  if (step.operation == AttemptOperation::kRenewal) {
    return {};
  }
  if (step.operation == AttemptOperation::kLogin) {
    if (Failure refusal = gate_.RefusalOf(step.tag, now.steady); refusal.IsSet()) {
      return refusal;
    }
  }
  return refusedSpecs_.Find(request.key->spec, step.tag, now.steady);
}

void Core::LeaveGate(Section& section, const RequestPtr& request, const LoginOutcome& outcome,
                     const Instant& now) noexcept {
  if (request->gate) {
    gate_.Leave(*request->gate, request, outcome, now.steady,
                [&section](const RequestPtr& next) { section.Start(next); });
    request->gate.reset();
  }
}

void Core::WithdrawFromGate(Section& section, const RequestPtr& request) noexcept {
  if (request->gate) {
    gate_.Withdraw(request, runtime_->Now().steady,
                   [&section](const RequestPtr& next) { section.Start(next); });
    request->gate.reset();
  }
}

}  // namespace SsoClient::Access
