#ifndef SSOCLIENT_ACCESS_TURN_QUEUE_H
#define SSOCLIENT_ACCESS_TURN_QUEUE_H

#include <list>
#include <memory>
#include <optional>
#include <utility>

namespace SsoClient::Access {

struct Request;
using RequestPtr = std::shared_ptr<Request>;

/// Requests that wait without a thread, in the order in which they came. Only `Add` needs memory.
/// Not thread-safe.
class TurnQueue {
 public:
  /// Where a request is in the queue; not set when it is not in it.
  using Ticket = std::optional<std::list<RequestPtr>::iterator>;
  enum class Decision { kKeep, kTake, kStop };

  bool IsEmpty() const noexcept { return requests_.empty(); }
  void Add(Ticket& ticket, const RequestPtr& request) {
    ticket = requests_.insert(requests_.end(), request);
  }
  /// Does nothing for a request that is not in the queue.
  void Remove(Ticket& ticket) noexcept {
    if (ticket) {
      requests_.erase(*std::exchange(ticket, std::nullopt));
    }
  }
  /// Visits the requests in their order. `visit` returns a decision, and has reset the ticket of a
  /// request that is to be taken from the queue.
  template <class Visit>
  void ForEach(const Visit& visit) noexcept {
    for (auto item = requests_.begin(); item != requests_.end();) {
      const Decision decision = visit(*item);
      if (decision == Decision::kStop) {
        return;
      }
      item = decision == Decision::kTake ? requests_.erase(item) : std::next(item);
    }
  }

 private:
  std::list<RequestPtr> requests_;
};

}  // namespace SsoClient::Access

#endif
