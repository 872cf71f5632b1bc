#ifndef SSOCLIENT_TESTS_CHAOS_CAMPAIGNS_H
#define SSOCLIENT_TESTS_CHAOS_CAMPAIGNS_H

#include "chaos/run.h"

/// The campaigns. Each checks, beside what is named here, the classes of all failures, that every
/// callback runs once, how long calls take, and the descriptors and threads of the process.
namespace SsoClient::Testing {

/// Answers of every operation that end at any octet, by a FIN, by a RST, and over TLS with and
/// without close_notify.
void RunCuts(Run& run);
/// A service that is silent in any stage of an exchange, for calls that their caller limits.
void RunStalls(Run& run);
/// Single allocations that fail, on the caller's thread and on those of the pool.
void RunAllocations(Run& run);
/// Threads that cannot be started, in a process that has none yet.
void RunThreads(Run& run);
/// Processes with few descriptors left.
void RunDescriptors(Run& run);
/// A clock that jumps before and during calls.
void RunClock(Run& run);
/// Processes that end, fork, or load and unload a plug-in at random moments of calls.
void RunExits(Run& run);
void RunForks(Run& run);
void RunPlugins(Run& run);

}  // namespace SsoClient::Testing

#endif
