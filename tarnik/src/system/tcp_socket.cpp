#include "system/tcp_socket.h"

#include <cerrno>
#include <exception>
#include <mutex>
#include <unordered_set>
#include <utility>

#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

namespace Tarnik::System {
namespace {

using boost::asio::ip::tcp;
using boost::system::error_code;

/// The descriptors of the sockets of this process.
class OpenSockets {
 public:
  // Never destroyed, since threads use it until the process ends.
  static OpenSockets& Get() {
    static OpenSockets& sockets = *new OpenSockets;
    return sockets;
  }

  std::mutex& Mutex() noexcept { return mutex_; }
  // These are called with the mutex held.
  void Add(int descriptor) { descriptors_.insert(descriptor); }
  void Remove(int descriptor) noexcept { descriptors_.erase(descriptor); }

  /// Closes a child's copies. Asio must not: it would also remove them from the parent's poll set.
  void CloseInChild() noexcept {
    for (const int descriptor : descriptors_) {
      ::close(descriptor);
    }
    descriptors_.clear();
    mutex_.unlock();
  }

 private:
  std::mutex mutex_;
  std::unordered_set<int> descriptors_;
};

// At load, so that no thread can be inside the initialisation while another forks.
[[maybe_unused]] const bool kSocketsTakePartInFork = [] {
  OpenSockets::Get();
  SetForkHooks(ForkOrder::kSockets, {[]() noexcept { OpenSockets::Get().Mutex().lock(); },
                                     []() noexcept { OpenSockets::Get().Mutex().unlock(); },
                                     []() noexcept { OpenSockets::Get().CloseInChild(); }});
  return true;
}();

}  // namespace

// The whole is done with the mutex held, so that a fork finds either no socket or one that the
// child closes.
error_code TCPSocket::Open(int family) noexcept {
  const std::lock_guard lock(OpenSockets::Get().Mutex());
  const int descriptor = ::socket(family, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, IPPROTO_TCP);
  if (descriptor < 0) {
    return {errno, boost::system::system_category()};
  }
  error_code error;
  try {
    OpenSockets::Get().Add(descriptor);
    socket_->assign(family == AF_INET6 ? tcp::v6() : tcp::v4(), descriptor, error);
  } catch (const std::exception&) {
    error = boost::asio::error::no_memory;
  }
  if (error) {
    OpenSockets::Get().Remove(descriptor);
    ::close(descriptor);
  }
  return error;
}

void TCPSocket::Close() noexcept {
  if (socket_.IsFromParent() || !socket_->is_open()) {
    return;
  }
  const std::lock_guard lock(OpenSockets::Get().Mutex());
  OpenSockets::Get().Remove(socket_->native_handle());
  error_code ignored;
  socket_->close(ignored);
}

void TCPSocket::TakeOver(TCPSocket& other) noexcept {
  Close();
  *socket_ = std::move(*other.socket_);
}

}  // namespace Tarnik::System
