#include "service/log_registry.h"

#include <future>
#include <thread>

#include <gtest/gtest.h>

#include "support/forked_child.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Service;

// In a child, a sink has no calls on the threads of its parent, so that replacing it does not wait
// for them.
TEST(LogRegistryTest, ChildForgetsTheCallsOfItsParent) {
  const StaticLogger logger("LogRegistryTest.Fork");
  std::promise<void> entered;
  std::promise<void> mayLeave;
  SetLogSink([&](const LogRecord&) {
    entered.set_value();
    mayLeave.get_future().wait();
  });
  std::thread writer([&] { LogInternal(logger, 1, "line", {}); });
  entered.get_future().wait();

  EXPECT_TRUE(HoldsInChild([&] {
    int lines = 0;
    SetLogSink([&lines](const LogRecord&) { ++lines; });
    SetLogLevel("LogRegistryTest.Fork", 1);
    LogInternal(logger, 1, "line", {});
    return lines == 1;
  }));

  mayLeave.set_value();
  writer.join();
  SetLogSink({});
}

}  // namespace
}  // namespace Tarnik::Testing
