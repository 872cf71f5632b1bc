#ifndef SSOCLIENT_ACCESS_TESTS_ATTEMPTS_GUARDED_SERVER_PROCESS_H
#define SSOCLIENT_ACCESS_TESTS_ATTEMPTS_GUARDED_SERVER_PROCESS_H

#include <condition_variable>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include <sys/types.h>

namespace SsoClient::Access::Testing {

/// The example `guarded_server` in the background. The destructor kills it if it still runs.
class GuardedServerProcess {
 public:
  /// Waits until the server listens. Throws `std::runtime_error` with its log when it ends before.
  explicit GuardedServerProcess(std::vector<std::string> arguments);
  ~GuardedServerProcess();
  GuardedServerProcess(const GuardedServerProcess&) = delete;
  GuardedServerProcess& operator=(const GuardedServerProcess&) = delete;

  int Port() const { return port_; }
  void Signal(int signal) const;
  /// Waits until the log contains `text`, and returns the log; the test fails after half a minute.
  std::string AwaitInLog(const std::string& text);
  /// Waits for its end and returns its exit status, or 128 plus the number of the signal that ended
  /// it. Kills it after half a minute.
  int WaitForEnd();

 private:
  void ReadLog(int descriptor);

  std::mutex mutex_;
  std::condition_variable logged_;
  std::string log_;
  pid_t process_ = -1;
  int port_ = 0;
  bool hasEnded_ = false;
  std::thread reader_;
};

}  // namespace SsoClient::Access::Testing

#endif
