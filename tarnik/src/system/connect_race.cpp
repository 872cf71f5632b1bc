#include "system/connect_race.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <exception>
#include <utility>

namespace Tarnik::System {
namespace {

using boost::asio::ip::tcp;
using boost::system::error_code;

// These errors only say that this host cannot use the address; the failure of another address is
// reported instead, if there is one.
bool IsUnusableAddress(const error_code& error) {
  namespace Error = boost::asio::error;
  return error == Error::network_unreachable || error == Error::address_family_not_supported ||
         error == Error::make_error_code(static_cast<Error::basic_errors>(EADDRNOTAVAIL));
}

tcp::endpoint ToEndpoint(const SocketAddress& address) {
  tcp::endpoint endpoint;
  std::memcpy(endpoint.data(), &address.storage, address.length);
  endpoint.resize(address.length);
  return endpoint;
}

}  // namespace

std::vector<SocketAddress> InterleaveFamilies(const std::vector<SocketAddress>& addresses) {
  std::vector<SocketAddress> result = addresses;
  const auto end = result.end();
  for (auto place = result.begin(); place != end; ++place) {
    const bool isFirst = place == result.begin();
    const auto isTurn = [&](const SocketAddress& address) {
      return isFirst || address.storage.ss_family != (place - 1)->storage.ss_family;
    };
    const auto next = std::find_if(place, end, isTurn);
    if (next == end) {
      break;  // only one family is left
    }
    std::rotate(place, next, next + 1);
  }
  return result;
}

ConnectRace::ConnectRace(boost::asio::io_context& ioContext, std::chrono::milliseconds attemptDelay,
                         Completion completion)
    : ioContext_(ioContext),
      attemptDelay_(attemptDelay),
      completion_(std::move(completion)),
      timer_(ioContext) {}

void ConnectRace::Start(const std::vector<SocketAddress>& addresses) {
  const std::vector<SocketAddress> ordered = InterleaveFamilies(addresses);
  {
    const std::lock_guard lock(mutex_);
    if (hasEnded_) {
      return;
    }
    for (const SocketAddress& address : ordered) {
      attempts_.emplace_back(ioContext_, address);
    }
    StartAttempts();
  }
  ReportFailure();
}

void ConnectRace::StartAttempts() {
  while (started_ < attempts_.size()) {
    Attempt& attempt = attempts_[started_++];
    if (const error_code error = Begin(attempt)) {
      NoteFailure(error);
      continue;
    }
    ++underWay_;
    nextStart_ = std::chrono::steady_clock::now() + attemptDelay_;
    if (WaitForNext()) {
      return;
    }
  }
}

error_code ConnectRace::Begin(Attempt& attempt) {
  if (const error_code error = attempt.socket.Open(attempt.address.storage.ss_family)) {
    return error;
  }
  error_code ignored;
  attempt.socket->set_option(tcp::no_delay(true), ignored);
  attempt.socket->async_connect(ToEndpoint(attempt.address),
                                WithMemory(attempt.memory, [self = Ref<ConnectRace>(this),
                                                            &attempt](const error_code& error) {
                                  self->OnConnected(attempt, error);
                                }));
  return {};
}

// One wait at a time: `OnTimer` waits again when the next start has been put off meanwhile. Returns
// false when the timer cannot be set, so that the next attempt starts at once.
bool ConnectRace::WaitForNext() {
  if (isTimerWaiting_ || started_ == attempts_.size()) {
    return true;
  }
  try {
    timer_->expires_at(nextStart_);
    timer_->async_wait(WithMemory(
        timerMemory_, [self = Ref<ConnectRace>(this)](const error_code&) { self->OnTimer(); }));
  } catch (const std::exception&) {
    return false;
  }
  isTimerWaiting_ = true;
  return true;
}

void ConnectRace::NoteFailure(const error_code& error) {
  if (!failure_ || !IsUnusableAddress(error)) {
    failure_ = error;
  }
}

void ConnectRace::OnConnected(Attempt& attempt, const error_code& error) {
  Completion completion;
  TCPSocket winner(ioContext_);
  {
    const std::lock_guard lock(mutex_);
    --underWay_;
    if (hasEnded_) {
      return;
    }
    if (error) {
      NoteFailure(error);
      attempt.socket.Close();
      StartAttempts();
    } else {
      completion.swap(completion_);
      winner.TakeOver(attempt.socket);
      End();
    }
  }
  if (completion) {
    completion(winner, {});
    return;
  }
  ReportFailure();
}

void ConnectRace::OnTimer() {
  {
    const std::lock_guard lock(mutex_);
    isTimerWaiting_ = false;
    if (hasEnded_) {
      return;
    }
    if (std::chrono::steady_clock::now() >= nextStart_ || !WaitForNext()) {
      StartAttempts();
    }
  }
  ReportFailure();
}

void ConnectRace::ReportFailure() {
  Completion completion;
  error_code failure;
  {
    const std::lock_guard lock(mutex_);
    if (hasEnded_ || underWay_ > 0 || started_ < attempts_.size()) {
      return;
    }
    completion.swap(completion_);
    failure = failure_;
    End();
  }
  TCPSocket none(ioContext_);
  completion(none, failure);
}

void ConnectRace::Cancel() noexcept {
  Completion dropped;
  const std::lock_guard lock(mutex_);
  dropped.swap(completion_);
  End();
}

void ConnectRace::End() noexcept {
  hasEnded_ = true;
  for (Attempt& attempt : attempts_) {
    attempt.socket.Close();
  }
  timer_->cancel();
}

}  // namespace Tarnik::System
