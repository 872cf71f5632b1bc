#include <atomic>
#include <exception>
#include <mutex>
#include <utility>

#include <boost/asio/buffer.hpp>
#include <boost/asio/post.hpp>

#include <tarnik/core/object_impl.h>
#include <tarnik/system/tcp_client_socket.h>

#include "support/fork.h"
#include "system/connect_race.h"
#include "system/connect_stage.h"
#include "system/handler_memory.h"
#include "system/host_name.h"
#include "system/peer_failures.h"
#include "system/tcp_client_socket_impl.h"
#include "system/tcp_socket.h"
#include "system/thread_pool_impl.h"

namespace Tarnik::System {
namespace {

using boost::system::error_code;

HostAddresses NoLookUpThread() noexcept {
  try {
    return {{}, "the thread for the host look-up cannot start"};
  } catch (const std::bad_alloc&) {
    return {};
  }
}

// The socket is called with the mutex held; completions run without it. An operation that has
// started on the socket is ended by its own handler, since the caller's buffer is in use until
// then; the handler checks `closed_` first. A connect is ended by `Close` itself. Handlers are in
// memory of this object, so that no operation can fail for want of memory once the connect has
// begun.
class TCPClientSocketImpl final : public TCPClientSocket,
                                  public ConnectProgress,
                                  public ObjectImpl {
 public:
  TCPClientSocketImpl(ThreadPoolImpl& pool, ConnectRules rules)
      : pool_(&pool), ioContext_(pool.IoContext()), rules_(std::move(rules)), socket_(ioContext_) {}

  void ConnectAsync(const std::string& host, int port, ConnectCompletion completion) override;
  void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) override;
  void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override;
  void Close() noexcept override;
  std::string ToString() const override;
  ConnectStage Stage() const noexcept override;
  int Port() const noexcept override { return port_; }

 private:
  enum class Phase { kNew, kLookingUp, kConnecting, kConnected, kFailed };
  using Self = Ref<TCPClientSocketImpl>;

  void StartLookUp(const std::string& host, int port);
  void LookUp(const std::string& host, int port);
  void EndLookUp(HostAddresses found) noexcept;
  void OnLookedUp();
  void OnConnected(TCPSocket& winner, const error_code& error);
  void EndConnect(Exception* error);
  void CancelConnect() noexcept;  // called with the mutex held
  ConnectCompletion TakeConnectCompletion();

  void RequireOwnProcess() const;
  void RequireIdle(bool busy, const char* operation) const;
  void OnRead(const error_code& error, std::size_t bytesRead);
  void BeginWrite();
  void OnWritten(const error_code& error, std::size_t bytesWritten);
  void EndWrite(Exception* error);

  const Ref<ThreadPoolImpl> pool_;
  // All handlers use one context, so that they run on one I/O thread.
  boost::asio::io_context& ioContext_;
  const ForkMark mark_;
  const ConnectRules rules_;
  mutable std::mutex mutex_;
  TCPSocket socket_;
  // All are set once, by `ConnectAsync`.
  std::string peer_ = "nobody";
  PeerFailures failures_{peer_};
  std::atomic<int> port_ = 0;
  std::atomic<Phase> phase_ = Phase::kNew;  // written with the mutex held
  bool closed_ = false;
  ConnectCompletion connectCompletion_;
  HostAddresses found_;
  Ref<ConnectRace> race_;
  bool reading_ = false;
  ReadCompletion readCompletion_;
  bool writing_ = false;
  const char* unwritten_ = nullptr;
  std::size_t unwrittenSize_ = 0;
  WriteCompletion writeCompletion_;
  HandlerMemory lookUpMemory_;
  HandlerMemory closeMemory_;
  HandlerMemory readMemory_;
  HandlerMemory writeMemory_;
};

std::string TCPClientSocketImpl::ToString() const {
  if (mark_.IsFromParent()) {
    return "<TCPClientSocket:of the parent process>";
  }
  const std::lock_guard lock(mutex_);
  return "<TCPClientSocket:" + peer_ + ">";
}

ConnectStage TCPClientSocketImpl::Stage() const noexcept {
  switch (phase_.load()) {
    case Phase::kNew:
    case Phase::kLookingUp:
      return ConnectStage::kLookUp;
    case Phase::kConnecting:
      return ConnectStage::kConnection;
    default:
      return ConnectStage::kConnected;
  }
}

void TCPClientSocketImpl::ConnectAsync(const std::string& host, int port,
                                       ConnectCompletion completion) {
  RequireHostName(host);
  if (port < 1 || port > 65535) {
    throw InvalidArgumentException("The port " + std::to_string(port) + " is not 1 to 65535.");
  }
  RequireOwnProcess();
  std::string peer = DescribeEndpoint(host, port);
  PeerFailures failures(peer);
  const auto race =
      MakeRef<ConnectRace>(ioContext_, rules_.attemptDelay,
                           [self = Self(this)](TCPSocket& winner, const error_code& error) {
                             self->OnConnected(winner, error);
                           });
  {
    const std::lock_guard lock(mutex_);
    if (phase_ != Phase::kNew) {
      throw InvalidStateException("The socket was already asked to connect.");
    }
    peer_.swap(peer);
    port_ = port;
    failures_ = failures;
    connectCompletion_ = std::move(completion);
    if (closed_) {
      CancelConnect();
      return;
    }
    phase_ = Phase::kLookingUp;
    race_ = race;
  }
  StartLookUp(host, port);
}

void TCPClientSocketImpl::StartLookUp(const std::string& host, int port) {
  if (IsAddressLiteral(host)) {
    LookUp(host, port);
    return;
  }
  try {
    std::function<void()> lookUp = [self = Self(this), host, port] { self->LookUp(host, port); };
    if (rules_.runLookUp) {
      rules_.runLookUp(std::move(lookUp));
    } else {
      pool_->RunLookup(std::move(lookUp));
    }
  } catch (const std::bad_alloc&) {
    EndLookUp({});
  } catch (const std::exception&) {
    // This may be an I/O thread, and the caller expects failures in the completion.
    EndLookUp(NoLookUpThread());
  }
}

void TCPClientSocketImpl::LookUp(const std::string& host, int port) {
  try {
    EndLookUp(rules_.lookUp(host, port));
  } catch (const std::bad_alloc&) {
    EndLookUp({});
  }
}

void TCPClientSocketImpl::EndLookUp(HostAddresses found) noexcept {
  {
    const std::lock_guard lock(mutex_);
    found_ = std::move(found);
  }
  boost::asio::post(ioContext_,
                    WithMemory(lookUpMemory_, [self = Self(this)] { self->OnLookedUp(); }));
}

void TCPClientSocketImpl::OnLookedUp() {
  HostAddresses found;
  Ref<ConnectRace> race;
  {
    const std::lock_guard lock(mutex_);
    std::swap(found, found_);
    race = race_;
    if (phase_ != Phase::kLookingUp) {
      return;  // ended by Close
    }
    phase_ = Phase::kConnecting;
  }
  if (found.addresses.empty()) {
    IOException error = found.error.empty()
                            ? failures_.noMemory
                            : failures_.Of("Cannot connect to ", peer_, found.error);
    EndConnect(&error);
    return;
  }
  try {
    race->Start(found.addresses);
  } catch (const std::bad_alloc&) {
    IOException error = failures_.noMemory;
    EndConnect(&error);
  }
}

void TCPClientSocketImpl::OnConnected(TCPSocket& winner, const error_code& error) {
  if (error) {
    IOException failure = failures_.Of("Cannot connect to ", peer_, error);
    EndConnect(&failure);
    return;
  }
  {
    const std::lock_guard lock(mutex_);
    if (!closed_) {
      socket_.TakeOver(winner);
    }
  }
  EndConnect(nullptr);
}

// Does nothing after `Close` has ended the connect.
void TCPClientSocketImpl::EndConnect(Exception* error) {
  ConnectCompletion completion;
  Ref<ConnectRace> race;
  {
    const std::lock_guard lock(mutex_);
    race.swap(race_);
    if (phase_ != Phase::kConnecting) {
      return;
    }
    phase_ = error == nullptr ? Phase::kConnected : Phase::kFailed;
    completion.swap(connectCompletion_);
  }
  if (completion) {
    completion(this, error);
  }
}

// Another thread may have held the mutex when this process was forked.
void TCPClientSocketImpl::RequireOwnProcess() const {
  if (mark_.IsFromParent()) {
    throw InvalidStateException("The socket belongs to the parent process.");
  }
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
  RequireOwnProcess();
  const std::lock_guard lock(mutex_);
  RequireIdle(reading_, "read");
  reading_ = true;
  readCompletion_ = std::move(completion);
  if (closed_) {
    boost::asio::post(ioContext_,
                      WithMemory(readMemory_, [self = Self(this)] { self->OnRead({}, 0); }));
    return;
  }
  socket_->async_read_some(
      boost::asio::buffer(buffer, size),
      WithMemory(readMemory_, [self = Self(this)](const error_code& error, std::size_t bytesRead) {
        self->OnRead(error, bytesRead);
      }));
}

void TCPClientSocketImpl::OnRead(const error_code& error, std::size_t bytesRead) {
  ReadCompletion completion;
  bool wasClosed = false;
  {
    const std::lock_guard lock(mutex_);
    reading_ = false;
    wasClosed = closed_;
    completion.swap(readCompletion_);
  }
  if (wasClosed) {
    CancelledException cancelled = failures_.closed;
    completion(0, &cancelled);
    return;
  }
  if (error && error != boost::asio::error::eof) {
    IOException failure = failures_.Of("Cannot read from ", peer_, error);
    completion(0, &failure);
    return;
  }
  completion(bytesRead, nullptr);
}

void TCPClientSocketImpl::WriteAsync(const char* data, std::size_t size,
                                     WriteCompletion completion) {
  RequireOwnProcess();
  const std::lock_guard lock(mutex_);
  RequireIdle(writing_, "write");
  writing_ = true;
  unwritten_ = data;
  unwrittenSize_ = size;
  writeCompletion_ = std::move(completion);
  if (closed_ || size == 0) {
    boost::asio::post(ioContext_,
                      WithMemory(writeMemory_, [self = Self(this)] { self->OnWritten({}, 0); }));
    return;
  }
  BeginWrite();
}

void TCPClientSocketImpl::BeginWrite() {
  socket_->async_write_some(boost::asio::buffer(unwritten_, unwrittenSize_),
                            WithMemory(writeMemory_, [self = Self(this)](const error_code& error,
                                                                         std::size_t bytesWritten) {
                              self->OnWritten(error, bytesWritten);
                            }));
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
    IOException failure = failures_.Of("Cannot write to ", peer_, error);
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
    completion.swap(writeCompletion_);
  }
  if (wasCutOff) {
    CancelledException cancelled = failures_.closed;
    completion(&cancelled);
    return;
  }
  completion(error);
}

void TCPClientSocketImpl::Close() noexcept {
  if (mark_.IsFromParent()) {
    return;
  }
  Ref<ConnectRace> race;
  {
    const std::lock_guard lock(mutex_);
    if (closed_) {
      return;
    }
    closed_ = true;
    socket_.Close();
    race.swap(race_);
    if (phase_ == Phase::kLookingUp || phase_ == Phase::kConnecting) {
      CancelConnect();
    }
  }
  if (race != nullptr) {
    race->Cancel();
  }
}

void TCPClientSocketImpl::CancelConnect() noexcept {
  phase_ = Phase::kFailed;
  boost::asio::post(ioContext_, WithMemory(closeMemory_, [self = Self(this)] {
                      CancelledException cancelled = self->failures_.closed;
                      if (const auto completion = self->TakeConnectCompletion()) {
                        completion(self.get(), &cancelled);
                      }
                    }));
}

TCPClientSocket::ConnectCompletion TCPClientSocketImpl::TakeConnectCompletion() {
  const std::lock_guard lock(mutex_);
  return std::exchange(connectCompletion_, nullptr);
}

}  // namespace

Ref<TCPClientSocket> CreateTCPClientSocket(ThreadPool* pool) {
  return CreateTCPClientSocket(ToThreadPoolImpl(pool), {});
}

Ref<TCPClientSocket> CreateTCPClientSocket(ThreadPoolImpl& pool, ConnectRules rules) {
  return MakeRef<TCPClientSocketImpl>(pool, std::move(rules));
}

}  // namespace Tarnik::System
