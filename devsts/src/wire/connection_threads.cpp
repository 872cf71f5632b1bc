#include "wire/connection_threads.h"

#include <csignal>
#include <exception>
#include <utility>

#include <pthread.h>
#include <unistd.h>

namespace DevSts {
namespace {

// OpenSSL has no option to write to sockets without raising the signal.
void BlockBrokenPipeSignal() {
  sigset_t signals;
  sigemptyset(&signals);
  sigaddset(&signals, SIGPIPE);
  pthread_sigmask(SIG_BLOCK, &signals, nullptr);
}

// If a test's hook throws, only its connection ends, not the process.
void ServeQuietly(Connection& connection, std::uint64_t id,
                  const std::function<void(Connection&, std::uint64_t id)>& serve) {
  try {
    serve(connection, id);
  } catch (const std::exception&) {
    connection.Abort();
  }
}

}  // namespace

void ConnectionThreads::Start(int socket, SSL_CTX* tls, const Serve& serve,
                              const std::function<void()>& closed) {
  std::unique_lock lock(mutex_);
  if (stopped_) {
    lock.unlock();
    close(socket);
    closed();
    return;
  }
  std::unique_ptr<Connection> made;
  try {
    made = std::make_unique<Connection>(socket, tls);
  } catch (const std::exception&) {
    close(socket);
  }
  if (!made || !StartThread(std::move(made), serve, closed)) {
    lock.unlock();
    closed();
    return;
  }
  JoinFinished(lock);
}

bool ConnectionThreads::StartThread(std::unique_ptr<Connection> made, const Serve& serve,
                                    const std::function<void()>& closed) {
  Connection& connection = *made;
  const std::uint64_t id = ++lastId_;
  try {
    Entry& entry = running_[id];
    entry.connection = std::move(made);
    // The new thread accesses the map only after the lock is released.
    entry.thread = std::thread([this, id, &connection, serve, closed] {
      BlockBrokenPipeSignal();
      ServeQuietly(connection, id, serve);
      Leave(id);
      closed();
    });
    return true;
  } catch (const std::exception&) {
    running_.erase(id);
    return false;
  }
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
