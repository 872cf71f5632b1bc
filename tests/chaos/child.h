#ifndef SSOCLIENT_TESTS_CHAOS_CHILD_H
#define SSOCLIENT_TESTS_CHAOS_CHILD_H

#include <exception>
#include <string>

#include "chaos/run.h"
#include "support/forked_child.h"

namespace SsoClient::Testing {

/// Runs `body` in a forked child, which has no threads of the pool yet, and requires that it
/// returns. The child ends within a minute.
template <class Body>
void RunInChild(const Run& run, const Body& body) {
  const bool hasSucceeded = Tarnik::Testing::HoldsInChild([&] {
    try {
      body();
      return true;
    } catch (const std::exception& failure) {
      run.Fail(std::string("an exception: ") + failure.what());
    }
  });
  run.Require(hasSucceeded, "a child process failed");
}

}  // namespace SsoClient::Testing

#endif
