#ifndef DEVSTS_REPLACED_CALLS_H
#define DEVSTS_REPLACED_CALLS_H

#include <chrono>
#include <vector>

namespace DevSts::Testing {

// As long as it exists, the next calls of accept4() in this process fail with these errors, one
// after another, at sockets of one family. One object at a time.
class AcceptErrors {
 public:
  AcceptErrors(int family, std::vector<int> errors);
  ~AcceptErrors();
  AcceptErrors(const AcceptErrors&) = delete;
  AcceptErrors& operator=(const AcceptErrors&) = delete;

  // The times of the calls that have failed. Waits, at most half a minute, until all have.
  static std::vector<std::chrono::steady_clock::time_point> AwaitTimes();
};

// As long as it exists, std::thread cannot start a thread in this process.
class NoThreads {
 public:
  NoThreads();
  ~NoThreads();
  NoThreads(const NoThreads&) = delete;
  NoThreads& operator=(const NoThreads&) = delete;
};

}  // namespace DevSts::Testing

#endif
