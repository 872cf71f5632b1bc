#include "support/source_fixture.h"

#include <utility>

#include "config_check.h"

namespace SsoClient::Access::Testing {

namespace {

Core::Parts MakeParts(const std::shared_ptr<const TokenSourceConfig>& config,
                      const std::shared_ptr<VirtualRuntime>& runtime,
                      const std::vector<std::shared_ptr<Script>>& scripts) {
  Core::Parts parts;
  parts.config = config;
  parts.runtime = runtime;
  for (std::size_t i = 0; i < config->endpoints.size(); ++i) {
    parts.clients.push_back(
        std::make_unique<ScriptedEndpoint>(config->endpoints[i], scripts.at(i)));
  }
  return parts;
}

}  // namespace

SourceFixture::SourceFixture() {
  config.name = "orders";
  config.endpoints = {{"https://a.example.com/sts", ""}, {"https://b.example.com/sts", ""}};
  config.login = PasswordLogin{"alice", [this] {
                                 ++passwordCalls;
                                 return password;
                               }};
  config.listener = listener;
  for (int i = 0; i < 3; ++i) {
    scripts.push_back(std::make_shared<Script>());
  }
  ForAll(Issues(hours(1)));
}

SourceFixture::~SourceFixture() {
  source.reset();
  runtime->DropWork();
}

void SourceFixture::UseCertificate() {
  config.login = CertificateLogin{};
  config.holderOfKey = HolderOfKeyConfig{Tarnik::MakeRef<NamedCertificate>("own"), nullptr};
}

void SourceFixture::Make() {
  TokenSourceConfig limited = config;
  LimitDurations(limited);
  const auto shared = std::make_shared<const TokenSourceConfig>(std::move(limited));
  source = std::make_shared<TokenSourceImpl>([shared, runtime = runtime, scripts = scripts] {
    return MakeParts(shared, runtime, scripts);
  });
}

std::shared_ptr<IssuedToken> SourceFixture::NewToken(std::chrono::milliseconds lifetime) {
  const auto start =
      std::chrono::duration_cast<std::chrono::microseconds>(runtime->Now().wall.time_since_epoch());
  const auto end = start + std::chrono::microseconds(lifetime);
  return std::make_shared<IssuedToken>("_" + std::to_string(++tokens_), start.count(), end.count());
}

Script::Function SourceFixture::Issues(std::chrono::milliseconds lifetime) {
  return [this, lifetime](const AttemptRequest&, Tarnik::Http::CallLimit&) {
    return Issued(NewToken(lifetime));
  };
}

Script::Function SourceFixture::Fails(AttemptOutcome outcome) {
  return [outcome](const AttemptRequest&, Tarnik::Http::CallLimit&) { return outcome; };
}

void SourceFixture::ForAll(const Script::Function& function) {
  for (const auto& script : scripts) {
    script->Set(function);
  }
}

std::shared_ptr<Reply> SourceFixture::Ask(const TokenSpec& asked, const CallContext& context) {
  auto reply = std::make_shared<Reply>();
  source->GetTokenAsync(
      asked, context,
      [reply](const std::shared_ptr<const SamlToken>& token, const Tarnik::Exception* failure) {
        ++reply->calls;
        reply->token = token;
        reply->failure = failure == nullptr ? nullptr : failure->Clone();
      });
  return reply;
}

Reply SourceFixture::Get(const TokenSpec& asked, const CallContext& context) {
  const auto reply = Ask(asked, context);
  runtime->Settle();
  return *reply;
}

CallContext SourceFixture::Within(std::chrono::milliseconds duration) const {
  CallContext context;
  context.deadline = runtime->Now().steady + duration;
  return context;
}

TokenSpec SourceFixture::SpecFor(const std::string& audience) {
  TokenSpec made;
  made.tokenLifetimeSec = 3600;
  made.audienceRestriction = {audience};
  return made;
}

std::size_t SourceFixture::Attempts() const {
  std::size_t attempts = 0;
  for (const auto& script : scripts) {
    attempts += script->Count();
  }
  return attempts;
}

}  // namespace SsoClient::Access::Testing
