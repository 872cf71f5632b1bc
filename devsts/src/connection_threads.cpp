#include "connection_threads.h"

#include <pthread.h>
#include <unistd.h>

#include <csignal>
#include <utility>

namespace DevSts {
namespace {

// OpenSSL writes to sockets without a way to keep the signal away.
void BlockBrokenPipeSignal() {
  sigset_t signals;
  sigemptyset(&signals);
  sigaddset(&signals, SIGPIPE);
  pthread_sigmask(SIG_BLOCK, &signals, nullptr);
}

}  // namespace

void ConnectionThreads::Start(int socket, SSL_CTX* tls,
                              const std::function<void(Connection&, std::uint64_t id)>& serve,
                              const std::function<void()>& closed) {
  std::unique_lock lock(mutex_);
  if (stopped_) {
    close(socket);
    return;
  }
  const std::uint64_t id = ++lastId_;
  Entry& entry = running_[id];
  entry.connection = std::make_unique<Connection>(socket, tls);
  Connection& connection = *entry.connection;
  entry.thread = std::thread([this, id, &connection, serve, closed] {
    BlockBrokenPipeSignal();
    serve(connection, id);
    Leave(id);
    closed();
  });
  JoinFinished(lock);
}

void ConnectionThreads::Leave(std::uint64_t id) {
  const std::lock_guard lock(mutex_);
  const auto entry = running_.find(id);
  finished_.push_back(std::move(entry->second.thread));
  running_.erase(entry);
  changed_.notify_all();
}

void ConnectionThreads::JoinFinished(std::unique_lock<std::mutex>& lock) {
  std::vector<std::thread> finished = std::exchange(finished_, {});
  lock.unlock();
  for (std::thread& thread : finished) {
    thread.join();
  }
  lock.lock();
}

void ConnectionThreads::Stop() {
  std::unique_lock lock(mutex_);
  stopped_ = true;
  for (auto& [id, entry] : running_) {
    entry.connection->Abort();
  }
  while (!running_.empty() || !finished_.empty()) {
    JoinFinished(lock);
    if (!running_.empty()) {
      changed_.wait(lock, [this] { return !finished_.empty(); });
    }
  }
}

}  // namespace DevSts
