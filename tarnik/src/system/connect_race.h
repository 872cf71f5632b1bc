#ifndef TARNIK_SYSTEM_CONNECT_RACE_H
#define TARNIK_SYSTEM_CONNECT_RACE_H

#include <chrono>
#include <cstddef>
#include <deque>
#include <functional>
#include <mutex>
#include <vector>

#include <boost/asio/basic_waitable_timer.hpp>
#include <boost/asio/io_context.hpp>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>

#include "support/fork.h"
#include "system/handler_memory.h"
#include "system/host_lookup.h"
#include "system/tcp_socket.h"

namespace Tarnik::System {

/// The time after which the next address is tried although the attempt before it is still under way
/// (RFC 8305, section 8).
inline constexpr std::chrono::milliseconds kConnectAttemptDelay{250};

/// `addresses` in the order in which to try them: the families take turns, beginning with that of
/// the first address (RFC 8305, section 4). The order within a family remains.
std::vector<SocketAddress> InterleaveFamilies(const std::vector<SocketAddress>& addresses);

/// Connects to the first of several addresses that accepts a connection (RFC 8305, section 5). The
/// next attempt starts when the one before it has failed, or when `attemptDelay` has passed since
/// it started. Thread-safe.
class ConnectRace final : public ObjectImpl {
 public:
  /// Runs once, on an I/O thread: with the connected socket and no error, or with the error to
  /// report. An error that only means that this host cannot use an address is reported only when
  /// there was no other.
  using Completion = std::function<void(TCPSocket& winner, const boost::system::error_code& error)>;

  ConnectRace(boost::asio::io_context& ioContext, std::chrono::milliseconds attemptDelay,
              Completion completion);

  /// Starts the first attempt; called once, on an I/O thread, with at least one address. Throws
  /// `std::bad_alloc`, and the completion then never runs. May run the completion.
  void Start(const std::vector<SocketAddress>& addresses);
  /// Closes all sockets. The completion does not run afterwards, unless it has begun already.
  void Cancel() noexcept;

 private:
  using Timer =
      boost::asio::basic_waitable_timer<std::chrono::steady_clock,
                                        boost::asio::wait_traits<std::chrono::steady_clock>,
                                        boost::asio::io_context::executor_type>;

  struct Attempt {
    Attempt(boost::asio::io_context& ioContext, const SocketAddress& target)
        : socket(ioContext), address(target) {}

    TCPSocket socket;
    const SocketAddress address;
    HandlerMemory memory;
  };

  ~ConnectRace() override = default;

  // These are called with the mutex held.
  void StartAttempts();
  boost::system::error_code Begin(Attempt& attempt);
  bool WaitForNext();
  void NoteFailure(const boost::system::error_code& error);
  void End() noexcept;

  void OnConnected(Attempt& attempt, const boost::system::error_code& error);
  void OnTimer();
  /// Runs the completion if every attempt has failed.
  void ReportFailure();

  boost::asio::io_context& ioContext_;
  const std::chrono::milliseconds attemptDelay_;
  std::mutex mutex_;
  Completion completion_;
  /// A deque, since attempts cannot be moved.
  std::deque<Attempt> attempts_;
  std::size_t started_ = 0;
  std::size_t underWay_ = 0;
  boost::system::error_code failure_;
  bool hasEnded_ = false;
  ForkBound<Timer> timer_;
  std::chrono::steady_clock::time_point nextStart_;
  bool isTimerWaiting_ = false;
  HandlerMemory timerMemory_;
};

}  // namespace Tarnik::System

#endif
