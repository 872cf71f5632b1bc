#include "token_source_impl.h"

#include <chrono>
#include <future>
#include <utility>

#include <tarnik/system/thread_pool.h>

#include "config_check.h"
#include "process_hooks.h"

namespace SsoClient::Access {

struct TokenSourceImpl::Process {
  std::uint64_t generation;
  std::shared_ptr<Core> core;
  std::future<void> end;  // ready when nothing of the core is left that belongs to the user
};

namespace {

constexpr std::chrono::seconds kEndLimit{1};

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

TokenSource::~TokenSource() = default;

TokenSourceImpl::TokenSourceImpl(MakeParts makeParts)
    : makeParts_(std::move(makeParts)), process_(MakeProcess()) {}

TokenSourceImpl::~TokenSourceImpl() {
  if (process_.load(std::memory_order_acquire)->generation != ForkGeneration()) {
    return;
  }
  const std::unique_ptr<Process> process(process_.load(std::memory_order_acquire));
  const bool isIdle = process->core->Stop(kEndLimit) && !process->core->IsRunningHere() &&
                      !Tarnik::System::IsProcessEnding();
  process->core.reset();
  if (isIdle) {
    // A worker may have the core for a moment more. The user's functions must not be destroyed
    // later, since their code may be that of a plug-in.
    process->end.wait_for(kEndLimit);
  }
}

TokenSourceImpl::Process* TokenSourceImpl::MakeProcess() const {
  Core::Parts parts = makeParts_();
  std::future<void> end = WatchEnd(parts.config);
  return new Process{ForkGeneration(), MakeCore(std::move(parts)), std::move(end)};
}

Core& TokenSourceImpl::Current() const {
  Process* known = process_.load(std::memory_order_acquire);
  if (known->generation == ForkGeneration()) {
    return *known->core;
  }
  std::unique_ptr<Process> made(MakeProcess());
  if (isStopped_) {
    made->core->Stop(std::chrono::milliseconds(0));
  }
  if (process_.compare_exchange_strong(known, made.get(), std::memory_order_acq_rel)) {
    return *made.release()->core;
  }
  made->core->Stop(std::chrono::milliseconds(0));
  return *known->core;
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
