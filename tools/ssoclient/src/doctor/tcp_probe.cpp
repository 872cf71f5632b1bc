#include "doctor/tcp_probe.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <string_view>

#include <poll.h>

namespace SsoClient::Tool::Doctor {
namespace {

using Clock = TimeLimit::Clock;

TcpAttempt Begin(const Address& address) {
  TcpAttempt attempt;
  attempt.address = address;
  attempt.socket =
      Descriptor(socket(address.octets.ss_family, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC, 0));
  if (attempt.socket.Get() < 0) {
    attempt.error = errno;
    return attempt;
  }
  const auto* octets = reinterpret_cast<const sockaddr*>(&address.octets);
  const bool isDone = connect(attempt.socket.Get(), octets, address.size) == 0;
  attempt.error = isDone ? 0 : errno;
  return attempt;
}

int ErrorOf(int socket) {
  int error = 0;
  socklen_t size = sizeof error;
  return getsockopt(socket, SOL_SOCKET, SO_ERROR, &error, &size) == 0 ? error : errno;
}

bool IsOpen(const TcpAttempt& attempt) {
  return attempt.error == EINPROGRESS;
}

// Waits for the attempts that are under way; false when the time is over.
bool Await(std::vector<TcpAttempt>& attempts, Clock::time_point start, Clock::time_point end) {
  std::vector<pollfd> polled;
  polled.reserve(attempts.size());
  for (const TcpAttempt& attempt : attempts) {
    // poll skips negative descriptors.
    polled.push_back({IsOpen(attempt) ? attempt.socket.Get() : -1, POLLOUT, 0});
  }
  const int wait = MillisecondsUntil(end);
  const int ready = poll(polled.data(), polled.size(), wait);
  for (std::size_t i = 0; ready > 0 && i < polled.size(); ++i) {
    if (polled[i].revents != 0) {
      attempts[i].error = ErrorOf(polled[i].fd);
      attempts[i].duration =
          std::chrono::duration_cast<std::chrono::microseconds>(Clock::now() - start);
    }
  }
  return wait > 0;
}

// False when the time is over, also while the socket is ready: it always is when the peer floods
// it.
bool WaitFor(int socket, short event, Clock::time_point end) {
  while (Clock::now() < end) {
    pollfd polled{socket, event, 0};
    const int ready = poll(&polled, 1, MillisecondsUntil(end));
    if (ready > 0) {
      return true;
    }
    if (ready < 0 && errno != EINTR) {
      return false;
    }
  }
  return false;
}

}  // namespace

std::vector<TcpAttempt> ConnectToAll(const std::vector<Address>& addresses, Clock::time_point end) {
  const Clock::time_point start = Clock::now();
  std::vector<TcpAttempt> attempts;
  attempts.reserve(addresses.size());
  for (const Address& address : addresses) {
    attempts.push_back(Begin(address));
  }
  while (std::any_of(attempts.begin(), attempts.end(), IsOpen)) {
    if (!Await(attempts, start, end)) {
      break;
    }
  }
  for (TcpAttempt& attempt : attempts) {
    if (IsOpen(attempt)) {
      attempt.error = ETIMEDOUT;
      attempt.duration =
          std::chrono::duration_cast<std::chrono::microseconds>(Clock::now() - start);
    }
  }
  return attempts;
}

Reading ReadSome(int socket, Clock::time_point end, std::string& octets) {
  std::array<char, 16384> buffer{};
  if (!WaitFor(socket, POLLIN, end)) {
    return Reading::kTimedOut;
  }
  const ssize_t size = recv(socket, buffer.data(), buffer.size(), 0);
  if (size > 0) {
    octets.append(buffer.data(), static_cast<std::size_t>(size));
    return Reading::kOctets;
  }
  return size == 0 ? Reading::kEnd : Reading::kFailed;
}

bool SendAll(int socket, const std::string& octets, Clock::time_point end) {
  return WriteAll(octets, [&](std::string_view rest) -> ssize_t {
    if (!WaitFor(socket, POLLOUT, end)) {
      return -1;
    }
    const ssize_t size = send(socket, rest.data(), rest.size(), MSG_NOSIGNAL);
    return size < 0 && (errno == EAGAIN || errno == EINTR) ? 0 : size;
  });
}

}  // namespace SsoClient::Tool::Doctor
