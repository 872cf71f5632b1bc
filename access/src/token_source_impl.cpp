#include "token_source_impl.h"

#include <chrono>
#include <future>
#include <utility>

#include <tarnik/system/thread_pool.h>

#include "config_check.h"
#include "process_hooks.h"

namespace SsoClient::Access {

namespace {

constexpr std::chrono::seconds kEndLimit{1};
constexpr std::chrono::milliseconds kNoWait{0};

// The core releases its configuration last.
std::future<void> WatchEnd(std::shared_ptr<const TokenSourceConfig>& config) {
  const auto end = std::make_shared<std::promise<void>>();
  config = {config.get(), [config, end](const TokenSourceConfig*) mutable {
              config.reset();
              end->set_value();
            }};
  return end->get_future();
}

std::shared_ptr<Core> MakeCore(Core::Parts parts) {
  auto core = Core::Create(std::move(parts));
  RegisterCore(core);
  return core;
}

Core::Parts MakeSystemParts(const std::shared_ptr<const TokenSourceConfig>& config) {
  Core::Parts parts;
  parts.config = config;
  parts.runtime = CreateSystemRuntime();
  for (const Endpoint& endpoint : config->endpoints) {
    parts.clients.push_back(CreateEndpointClient(config, endpoint));
  }
  return parts;
}

}  // namespace

/// The core of one process.
struct TokenSourceImpl::Process {
  Process(Core::Parts parts, bool isStopped)
      : end(WatchEnd(parts.config)), core(MakeCore(std::move(parts))) {
    if (isStopped) {
      core->Stop(kNoWait);
    }
  }
  ~Process() {
    if (core != nullptr) {
      core->Stop(kNoWait);
    }
  }
  Process(const Process&) = delete;
  Process& operator=(const Process&) = delete;

  std::future<void> end;  // ready when nothing of the core is left that belongs to the user
  std::shared_ptr<Core> core;
};

TokenSource::~TokenSource() = default;

TokenSourceImpl::TokenSourceImpl(MakeParts makeParts) : makeParts_(std::move(makeParts)) {
  Current();
}

TokenSourceImpl::~TokenSourceImpl() {
  Process* const process = process_.Find();
  if (process == nullptr) {
    return;
  }
  const bool isIdle = process->core->Stop(kEndLimit) && !process->core->IsRunningHere() &&
                      !Tarnik::System::IsProcessEnding();
  process->core.reset();
  if (isIdle) {
    // A worker may have the core for a moment more. The user's functions must not be destroyed
    // later, since their code may be that of a plug-in.
    process->end.wait_for(kEndLimit);
  }
}

Core& TokenSourceImpl::Current() const {
  Process& process = process_.Get([this] { return Process(makeParts_(), isStopped_); });
  return *process.core;
}

std::shared_ptr<const SamlToken> TokenSourceImpl::GetToken(const TokenSpec& spec,
                                                           const CallContext& context) {
  return Current().GetToken(spec, context);
}

std::shared_ptr<const SamlToken> TokenSourceImpl::TryGetToken(const TokenSpec& spec) {
  return Current().TryGetToken(spec);
}

void TokenSourceImpl::GetTokenAsync(const TokenSpec& spec, const CallContext& context,
                                    TokenCallback callback) {
  Current().GetTokenAsync(spec, context, std::move(callback));
}

void TokenSourceImpl::GetAnswerAsync(const TokenSpec& spec, const CallContext& context,
                                     AnswerCallback callback) {
  Current().GetAnswerAsync(spec, context, std::move(callback));
}

void TokenSourceImpl::Invalidate(const SamlToken& token) {
  Current().Invalidate(token);
}

TokenSourceMetrics TokenSourceImpl::Metrics() const {
  return Current().Metrics();
}

bool TokenSourceImpl::Stop(std::chrono::milliseconds wait) {
  isStopped_ = true;
  return Current().Stop(wait);
}

std::shared_ptr<TokenSource> CreateTokenSource(TokenSourceConfig config) {
  CheckConfig(config);
  LimitDurations(config);
  const auto shared = std::make_shared<const TokenSourceConfig>(std::move(config));
  return std::make_shared<TokenSourceImpl>([shared] { return MakeSystemParts(shared); });
}

}  // namespace SsoClient::Access
