#ifndef DEVSTS_WIRE_CONNECTION_THREADS_H
#define DEVSTS_WIRE_CONNECTION_THREADS_H

#include <condition_variable>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

#include "wire/connection.h"

namespace DevSts {

// One thread for each connection. Thread-safe.
class ConnectionThreads {
 public:
  ConnectionThreads() = default;
  ~ConnectionThreads() { Stop(); }
  ConnectionThreads(const ConnectionThreads&) = delete;
  ConnectionThreads& operator=(const ConnectionThreads&) = delete;

  using Serve = std::function<void(Connection&, std::uint64_t id)>;

  // Runs `serve` with the connection on a new thread, then closes the connection and calls
  // `closed`. After `Stop`, and if the system has no thread for it, closes the socket at once and
  // calls `closed`.
  void Start(int socket, SSL_CTX* tls, const Serve& serve, const std::function<void()>& closed);
  // Ends all connections and waits for their threads.
  void Stop();

 private:
  struct Entry {
    std::unique_ptr<Connection> connection;
    std::thread thread;
  };

  // Returns false if there is no thread; the connection is then closed.
  bool StartThread(std::unique_ptr<Connection> made, const Serve& serve,
                   const std::function<void()>& closed);
  void Leave(std::uint64_t id);
  void JoinFinished(std::unique_lock<std::mutex>& lock);

  std::mutex mutex_;
  bool stopped_ = false;
  std::uint64_t lastId_ = 0;
  std::map<std::uint64_t, Entry> running_;
  std::vector<std::thread> finished_;
  std::condition_variable changed_;
};

}  // namespace DevSts

#endif
