#ifndef TARNIK_TESTS_SUPPORT_DEAD_LISTENER_H
#define TARNIK_TESTS_SUPPORT_DEAD_LISTENER_H

#include <vector>

#include "support/loopback.h"

namespace Tarnik::Testing {

/// Listens on 127.0.0.1 with a full backlog, so that a connect to it stays unanswered.
class DeadListener {
 public:
  DeadListener();

  int Port() const { return listener_.Port(); }

 private:
  const LoopbackListener listener_{false, 0};
  std::vector<Descriptor> fillers_;
};

}  // namespace Tarnik::Testing

#endif
