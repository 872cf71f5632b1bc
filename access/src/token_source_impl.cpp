#include "token_source_impl.h"

#include <utility>

#include "config_check.h"
#include "process_hooks.h"

namespace SsoClient::Access {

struct TokenSourceImpl::Process {
  std::uint64_t generation;
  std::shared_ptr<Core> core;
};

namespace {

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
  Process* const process = process_.load(std::memory_order_acquire);
  if (process->generation == ForkGeneration()) {
    process->core->Stop(std::chrono::seconds(1));
    delete process;
  }
}

TokenSourceImpl::Process* TokenSourceImpl::MakeProcess() const {
  return new Process{ForkGeneration(), MakeCore(makeParts_())};
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
