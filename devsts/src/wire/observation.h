#ifndef DEVSTS_WIRE_OBSERVATION_H
#define DEVSTS_WIRE_OBSERVATION_H

#include <condition_variable>
#include <deque>
#include <functional>
#include <mutex>
#include <vector>

#include "devsts/server.h"

namespace DevSts {

// The log of requests and the counters. Thread-safe.
class Observation {
 public:
  explicit Observation(std::size_t requestLimit) : requestLimit_(requestLimit) {}

  void Count(const std::function<void(Counters&)>& change);
  // Logs the request and changes the counters in one step.
  void Add(const ReceivedRequest& request, const std::function<void(Counters&)>& change);

  std::vector<ReceivedRequest> Requests() const;
  ReceivedRequest LastRequest() const;
  void ClearRequests();
  Counters GetCounters() const;
  bool WaitUntil(const std::function<bool(const Counters&)>& condition,
                 std::chrono::milliseconds timeout) const;

 private:
  const std::size_t requestLimit_;
  mutable std::mutex mutex_;
  mutable std::condition_variable changed_;
  std::deque<ReceivedRequest> requests_;
  Counters counters_;
};

}  // namespace DevSts

#endif
