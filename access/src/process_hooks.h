#ifndef SSOCLIENT_ACCESS_PROCESS_HOOKS_H
#define SSOCLIENT_ACCESS_PROCESS_HOOKS_H

#include <cstdint>
#include <memory>

namespace SsoClient::Access {

class Core;

/// Differs between a process and its forked children.
std::uint64_t ForkGeneration() noexcept;

/// From now on, `core` is notified when the process ends, if `WatchProcessEnd` has been called.
void RegisterCore(const std::shared_ptr<Core>& core);

/// Registers a handler for the end of the process, once. It must run before that of the thread
/// pool, since it needs worker threads for callbacks: called when the pool has been started.
void WatchProcessEnd() noexcept;

/// What the handler does: ends the calls of all sources, and waits a moment for their callbacks.
void EndCoresOfProcess() noexcept;

}  // namespace SsoClient::Access

#endif
