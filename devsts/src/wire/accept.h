#ifndef DEVSTS_WIRE_ACCEPT_H
#define DEVSTS_WIRE_ACCEPT_H

#include <atomic>
#include <functional>

namespace DevSts {

// Accepts connections and calls `take` with each new socket, which `take` then owns. Connections
// that the system cannot accept for now, for example because it has too few file descriptors, wait
// in the queue of the listener until it can.
//
// Returns 0 after the listener has been shut down with `stopped` set before, and the error number
// if the listener can no longer be used.
int AcceptUntilStopped(int listener, const std::atomic<bool>& stopped,
                       const std::function<void(int socket)>& take);

}  // namespace DevSts

#endif
