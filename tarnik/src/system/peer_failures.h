#ifndef TARNIK_SYSTEM_PEER_FAILURES_H
#define TARNIK_SYSTEM_PEER_FAILURES_H

#include <new>
#include <string>

#include <boost/system/error_code.hpp>

#include <tarnik/core/exception.h>

namespace Tarnik::System {

/// The failures of operations with one peer. Those without a cause are made in advance, so that
/// they can be reported without memory.
struct PeerFailures {
  explicit PeerFailures(const std::string& peer)
      : closed("The connection to " + peer + " was closed on this side."),
        noMemory("There is not enough memory for the connection to " + peer + ".") {}

  /// `noMemory` when there is no memory for the message. `operation` is, for example, "Cannot
  /// connect to ".
  IOException Of(const char* operation, const std::string& peer,
                 const std::string& cause) const noexcept {
    try {
      return IOException(operation + peer + ": " + cause);
    } catch (const std::bad_alloc&) {
      return noMemory;
    }
  }
  IOException Of(const char* operation, const std::string& peer,
                 const boost::system::error_code& cause) const noexcept {
    try {
      return Of(operation, peer, cause.message());
    } catch (const std::bad_alloc&) {
      return noMemory;
    }
  }

  CancelledException closed;
  IOException noMemory;
};

}  // namespace Tarnik::System

#endif
