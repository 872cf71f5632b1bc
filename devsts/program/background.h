#ifndef DEVSTS_PROGRAM_BACKGROUND_H
#define DEVSTS_PROGRAM_BACKGROUND_H

#include <functional>

namespace DevSts::Program {

// Calls `run` in a process in the background, which belongs to no terminal. The caller's process
// returns 0 as soon as `run` calls its argument, after which the standard streams of the new
// process are those of /dev/null; it returns what `run` returns if that is earlier. In the new
// process, returns what `run` returns. There must be only one thread.
int RunInBackground(const std::function<int(const std::function<void()>& ready)>& run);

}  // namespace DevSts::Program

#endif
