#ifndef TARNIK_SYSTEM_POOL_THREAD_H
#define TARNIK_SYSTEM_POOL_THREAD_H

#include <functional>

namespace Tarnik::System {

/// Starts a detached thread that debuggers show as `name` (at most 15 characters). The host
/// program's signal handlers never run on it: all signals are blocked except those that a thread
/// raises itself. Throws `std::system_error` when the system cannot create a thread.
void StartPoolThread(const char* name, std::function<void()> body);

/// Stops the calling thread until the process ends.
[[noreturn]] void ParkThread() noexcept;

}  // namespace Tarnik::System

#endif
