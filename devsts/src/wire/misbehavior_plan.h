#ifndef DEVSTS_WIRE_MISBEHAVIOR_PLAN_H
#define DEVSTS_WIRE_MISBEHAVIOR_PLAN_H

#include <list>
#include <mutex>
#include <optional>

#include "devsts/misbehavior.h"

namespace DevSts {

// The misbehaviour for the next connections and requests. Thread-safe.
class MisbehaviorPlan {
 public:
  void Set(Misbehavior misbehavior);
  // Forgets all misbehaviour.
  void Clear();
  void Next(Misbehavior misbehavior, std::size_t count);

  // The stall for a new connection.
  Stall TakeForConnection();
  // The misbehaviour for the next request.
  Misbehavior TakeForRequest();

 private:
  struct Entry {
    Misbehavior misbehavior;
    std::size_t left;
  };

  std::optional<Misbehavior> Take(bool forConnection);

  std::mutex mutex_;
  std::optional<Misbehavior> standing_;
  std::list<Entry> next_;
};

}  // namespace DevSts

#endif
