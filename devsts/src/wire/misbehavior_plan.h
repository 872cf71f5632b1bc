#ifndef DEVSTS_WIRE_MISBEHAVIOR_PLAN_H
#define DEVSTS_WIRE_MISBEHAVIOR_PLAN_H

#include <list>
#include <mutex>
#include <optional>

#include "devsts/misbehavior.h"

namespace DevSts {

// Which misbehaviour is due next. Safe on any thread.
class MisbehaviorPlan {
 public:
  void Set(Misbehavior misbehavior);
  // Forgets everything that was set or due.
  void Clear();
  void Next(Misbehavior misbehavior, std::size_t count);

  // A stall that a new connection is to meet.
  Stall TakeForConnection();
  // What the next request is to meet.
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
