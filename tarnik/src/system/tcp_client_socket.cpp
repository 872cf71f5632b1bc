#include <cstring>
#include <mutex>
#include <utility>
#include <vector>

#include <boost/asio/buffer.hpp>
#include <boost/asio/ip/tcp.hpp>

#include <tarnik/core/object_impl.h>
#include <tarnik/system/tcp_client_socket.h>

#include "system/host_lookup.h"
#include "system/host_name.h"
#include "system/thread_pool_impl.h"

namespace Tarnik::System {
namespace {

using boost::asio::ip::tcp;
using boost::system::error_code;

// The socket is called with the mutex held; completions run without it. An operation that has
// started on the socket is ended by its own handler, since the caller's buffer is in use until
// then; the handler checks `closed_` first. `Close` itself ends only a connect that still waits for
// its lookup.
class TCPClientSocketImpl final : public TCPClientSocket, public ObjectImpl {
 public:
  explicit TCPClientSocketImpl(ThreadPoolImpl& pool)
      : pool_(&pool), socket_(pool.IoContext()), peer_("nobody") {}

  void ConnectAsync(const std::string& host, int port, ConnectCompletion completion) override;
  void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) override;
  void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override;
  void Close() noexcept override;
  std::string ToString() const override;

 private:
  enum class Phase { kNew, kLookingUp, kConnecting, kConnected, kFailed };
  using Self = Ref<TCPClientSocketImpl>;

  void StartLookUp(const std::string& host, int port);
  void OnLookedUp(const HostAddresses& found);
  void TryNextAddress(std::string cause);
  bool BeginConnect(const SocketAddress& address, const std::string& cause, error_code& error);
  void OnConnected(const error_code& error, const std::string& previousCause);
  void EndConnect(Exception* error);

  void RequireIdle(bool busy, const char* operation) const;
  void OnRead(const error_code& error, std::size_t bytesRead, const ReadCompletion& completion);
  void BeginWrite();
  void OnWritten(const error_code& error, std::size_t bytesWritten);
  void EndWrite(Exception* error);
  CancelledException ClosedError() const {
    return CancelledException("The connection to " + peer_ + " was closed on this side.");
  }

  const Ref<ThreadPoolImpl> pool_;
  mutable std::mutex mutex_;
  tcp::socket socket_;
  std::string peer_;  // set once, by ConnectAsync
  Phase phase_ = Phase::kNew;
  bool closed_ = false;
  ConnectCompletion connectCompletion_;
  std::vector<SocketAddress> addresses_;  // those not tried yet, the next one last
  bool reading_ = false;
  bool writing_ = false;
  const char* unwritten_ = nullptr;
  std::size_t unwrittenSize_ = 0;
  WriteCompletion writeCompletion_;
};

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

std::string TCPClientSocketImpl::ToString() const {
  const std::lock_guard lock(mutex_);
  return "<TCPClientSocket:" + peer_ + ">";
}

void TCPClientSocketImpl::ConnectAsync(const std::string& host, int port,
                                       ConnectCompletion completion) {
  RequireHostName(host);
  if (port < 1 || port > 65535) {
    throw InvalidArgumentException("The port " + std::to_string(port) + " is not 1 to 65535.");
  }
  {
    const std::lock_guard lock(mutex_);
    if (phase_ != Phase::kNew) {
      throw InvalidStateException("The socket was already asked to connect.");
    }
    phase_ = Phase::kLookingUp;
    peer_ = DescribeEndpoint(host, port);
    connectCompletion_ = std::move(completion);
  }
  StartLookUp(host, port);
}

void TCPClientSocketImpl::StartLookUp(const std::string& host, int port) {
  const auto lookUp = [self = Self(this), host, port] {
    self->pool_->Post([self, found = LookUpHost(host, port)] { self->OnLookedUp(found); });
  };
  if (IsAddressLiteral(host)) {
    lookUp();
    return;
  }
  pool_->RunLookup(lookUp);
}

void TCPClientSocketImpl::OnLookedUp(const HostAddresses& found) {
  {
    const std::lock_guard lock(mutex_);
    if (phase_ != Phase::kLookingUp) {
      return;  // ended by Close
    }
    phase_ = Phase::kConnecting;
    addresses_.assign(found.addresses.rbegin(), found.addresses.rend());
  }
  TryNextAddress(found.error);
}

void TCPClientSocketImpl::TryNextAddress(std::string cause) {
  {
    const std::lock_guard lock(mutex_);
    while (!closed_ && !addresses_.empty()) {
      const SocketAddress address = addresses_.back();
      addresses_.pop_back();
      error_code error;
      if (BeginConnect(address, cause, error)) {
        return;
      }
      cause = cause.empty() || !IsUnusableAddress(error) ? error.message() : cause;
    }
  }
  IOException error("Cannot connect to " + peer_ + ": " + cause);
  EndConnect(&error);
}

bool TCPClientSocketImpl::BeginConnect(const SocketAddress& address, const std::string& cause,
                                       error_code& error) {
  error_code ignored;
  socket_.close(ignored);
  socket_.open(address.storage.ss_family == AF_INET6 ? tcp::v6() : tcp::v4(), error);
  if (error) {
    return false;
  }
  socket_.set_option(tcp::no_delay(true), ignored);
  socket_.async_connect(ToEndpoint(address), [self = Self(this), cause](const error_code& result) {
    self->OnConnected(result, cause);
  });
  return true;
}

void TCPClientSocketImpl::OnConnected(const error_code& error, const std::string& previousCause) {
  if (!error) {
    EndConnect(nullptr);
    return;
  }
  const bool keepsPrevious = IsUnusableAddress(error) && !previousCause.empty();
  TryNextAddress(keepsPrevious ? previousCause : error.message());
}

void TCPClientSocketImpl::EndConnect(Exception* error) {
  ConnectCompletion completion;
  bool wasClosed = false;
  {
    const std::lock_guard lock(mutex_);
    phase_ = error == nullptr ? Phase::kConnected : Phase::kFailed;
    wasClosed = closed_;
    completion = std::exchange(connectCompletion_, nullptr);
  }
  if (!completion) {
    return;
  }
  if (wasClosed) {
    CancelledException cancelled = ClosedError();
    completion(this, &cancelled);
    return;
  }
  completion(this, error);
}

void TCPClientSocketImpl::RequireIdle(bool busy, const char* operation) const {
  if (phase_ != Phase::kConnected && !closed_) {
    throw InvalidStateException("The socket is not connected.");
  }
  if (busy) {
    throw InvalidStateException(std::string("A ") + operation + " is under way already.");
  }
}

void TCPClientSocketImpl::ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) {
  if (size == 0) {
    throw InvalidArgumentException("A read needs room for at least one byte.");
  }
  const std::lock_guard lock(mutex_);
  RequireIdle(reading_, "read");
  reading_ = true;
  if (closed_) {
    pool_->Post([self = Self(this), completion = std::move(completion)] {
      self->OnRead({}, 0, completion);
    });
    return;
  }
  socket_.async_read_some(boost::asio::buffer(buffer, size),
                          [self = Self(this), completion = std::move(completion)](
                              const error_code& error, std::size_t bytesRead) {
                            self->OnRead(error, bytesRead, completion);
                          });
}

void TCPClientSocketImpl::OnRead(const error_code& error, std::size_t bytesRead,
                                 const ReadCompletion& completion) {
  bool wasClosed = false;
  {
    const std::lock_guard lock(mutex_);
    reading_ = false;
    wasClosed = closed_;
  }
  if (wasClosed) {
    CancelledException cancelled = ClosedError();
    completion(0, &cancelled);
    return;
  }
  if (error && error != boost::asio::error::eof) {
    IOException failure("Cannot read from " + peer_ + ": " + error.message());
    completion(0, &failure);
    return;
  }
  completion(bytesRead, nullptr);
}

void TCPClientSocketImpl::WriteAsync(const char* data, std::size_t size,
                                     WriteCompletion completion) {
  const std::lock_guard lock(mutex_);
  RequireIdle(writing_, "write");
  writing_ = true;
  unwritten_ = data;
  unwrittenSize_ = size;
  writeCompletion_ = std::move(completion);
  if (closed_ || size == 0) {
    pool_->Post([self = Self(this)] { self->OnWritten({}, 0); });
    return;
  }
  BeginWrite();
}

void TCPClientSocketImpl::BeginWrite() {
  socket_.async_write_some(boost::asio::buffer(unwritten_, unwrittenSize_),
                           [self = Self(this)](const error_code& error, std::size_t bytesWritten) {
                             self->OnWritten(error, bytesWritten);
                           });
}

void TCPClientSocketImpl::OnWritten(const error_code& error, std::size_t bytesWritten) {
  {
    const std::lock_guard lock(mutex_);
    unwritten_ += bytesWritten;
    unwrittenSize_ -= bytesWritten;
    if (!closed_ && !error && unwrittenSize_ > 0) {
      BeginWrite();
      return;
    }
  }
  if (error) {
    IOException failure("Cannot write to " + peer_ + ": " + error.message());
    EndWrite(&failure);
    return;
  }
  EndWrite(nullptr);
}

void TCPClientSocketImpl::EndWrite(Exception* error) {
  WriteCompletion completion;
  bool wasCutOff = false;
  {
    const std::lock_guard lock(mutex_);
    writing_ = false;
    wasCutOff = closed_;
    completion = std::exchange(writeCompletion_, nullptr);
  }
  if (wasCutOff) {
    CancelledException cancelled = ClosedError();
    completion(&cancelled);
    return;
  }
  completion(error);
}

void TCPClientSocketImpl::Close() noexcept {
  const std::lock_guard lock(mutex_);
  if (closed_) {
    return;
  }
  closed_ = true;
  error_code ignored;
  socket_.close(ignored);
  if (phase_ == Phase::kLookingUp) {
    phase_ = Phase::kFailed;
    pool_->Post([self = Self(this)] { self->EndConnect(nullptr); });
  }
}

}  // namespace

Ref<TCPClientSocket> CreateTCPClientSocket(ThreadPool* pool) {
  return MakeRef<TCPClientSocketImpl>(ToThreadPoolImpl(pool));
}

}  // namespace Tarnik::System
