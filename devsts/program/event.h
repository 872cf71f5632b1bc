#ifndef DEVSTS_PROGRAM_EVENT_H
#define DEVSTS_PROGRAM_EVENT_H

#include "descriptor.h"

namespace DevSts::Program {

// A descriptor that can be read from the first call of `Set` on. Thread-safe.
class Event {
 public:
  // Throws ProgramError.
  Event();

  void Set() const;
  int Get() const { return descriptor_.Get(); }

 private:
  Descriptor descriptor_;
};

}  // namespace DevSts::Program

#endif
