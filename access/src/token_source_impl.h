#ifndef SSOCLIENT_ACCESS_TOKEN_SOURCE_IMPL_H
#define SSOCLIENT_ACCESS_TOKEN_SOURCE_IMPL_H

#include <atomic>
#include <functional>
#include <memory>

#include <ssoclient/access/token_source.h>

#include "core.h"
#include "per_process.h"

namespace SsoClient::Access {

/// A token source, with a core for each process: a forked child begins with a new one. The core of
/// the parent is never touched in the child, where its locks may be held by threads that do not
/// exist.
class TokenSourceImpl final : public TokenSource {
 public:
  /// Makes what a new core consists of.
  using MakeParts = std::function<Core::Parts()>;

  explicit TokenSourceImpl(MakeParts makeParts);
  ~TokenSourceImpl() override;
  TokenSourceImpl(const TokenSourceImpl&) = delete;
  TokenSourceImpl& operator=(const TokenSourceImpl&) = delete;

  std::shared_ptr<const SamlToken> GetToken(const TokenSpec& spec,
                                            const CallContext& context) override;
  std::shared_ptr<const SamlToken> TryGetToken(const TokenSpec& spec) override;
  void GetTokenAsync(const TokenSpec& spec, const CallContext& context,
                     TokenCallback callback) override;
  /// As `GetTokenAsync`, with the kind of a failure.
  void GetAnswerAsync(const TokenSpec& spec, const CallContext& context, AnswerCallback callback);
  void Invalidate(const SamlToken& token) override;
  TokenSourceMetrics Metrics() const override;
  bool Stop(std::chrono::milliseconds wait) override;

 private:
  struct Process;

  Core& Current() const;

  const MakeParts makeParts_;
  // In a child, the source is stopped if it was stopped in the parent before.
  std::atomic<bool> isStopped_{false};
  PerProcess<Process> process_;
};

}  // namespace SsoClient::Access

#endif
