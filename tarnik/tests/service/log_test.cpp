#include <atomic>
#include <deque>
#include <future>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/service/log.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Service;

struct Line {
  std::string logger;
  int level;
  std::string text;
};

class LogTest : public testing::Test {
 protected:
  LogTest() {
    SetLogSink([this](const LogRecord& record) {
      const std::lock_guard guard(mutex_);
      lines_.push_back({std::string(record.logger), record.level, std::string(record.text)});
    });
  }
  ~LogTest() override { SetLogSink({}); }

  std::mutex mutex_;
  std::vector<Line> lines_;
};

TEST_F(LogTest, NewLoggerWritesWarningsAndWorse) {
  const StaticLogger logger("LogTest.New");
  EXPECT_EQ(logger.Level(), 4);
  LogInternal(logger, 4, "warning %1", {1});
  LogInternal(logger, 5, "notice", {});
  ASSERT_EQ(lines_.size(), 1U);
  EXPECT_EQ(lines_[0].logger, "LogTest.New");
  EXPECT_EQ(lines_[0].level, 4);
  EXPECT_EQ(lines_[0].text, "warning 1");
}

TEST_F(LogTest, LevelIsSharedByNameAndMayBeSetBeforehand) {
  SetLogLevel("LogTest.Shared", 7);
  const StaticLogger first("LogTest.Shared");
  const StaticLogger second("LogTest.Shared");
  EXPECT_TRUE(first.IsEnabled(7));
  EXPECT_FALSE(first.IsEnabled(8));
  SetLogLevel("LogTest.Shared", 0);
  EXPECT_FALSE(second.IsEnabled(1));
}

TEST_F(LogTest, RefusesLevelsOutsideTheScale) {
  EXPECT_THROW(SetLogLevel("LogTest.Range", -1), InvalidArgumentException);
  EXPECT_THROW(SetLogLevel("LogTest.Range", 10), InvalidArgumentException);
}

TEST_F(LogTest, WritesEachCallAsOneLine) {
  const StaticLogger logger("LogTest.Escape");
  LogInternal(logger, 1, "%1", {"a\nforged line\r\x1b[31m\x7f\xC3\xA4"});
  ASSERT_EQ(lines_.size(), 1U);
  EXPECT_EQ(lines_[0].text, "a\\x0aforged line\\x0d\\x1b[31m\\x7f\xC3\xA4");
}

TEST_F(LogTest, SinkThatThrowsDoesNotAffectTheCaller) {
  SetLogSink([](const LogRecord&) { throw std::runtime_error("full"); });
  const StaticLogger logger("LogTest.Throw");
  LogInternal(logger, 1, "line", {});
}

TEST_F(LogTest, EmptySinkRestoresStandardError) {
  const StaticLogger logger("LogTest.Default");
  SetLogSink({});
  testing::internal::CaptureStderr();
  LogInternal(logger, 2, "to %1", {"stderr"});
  const std::string output = testing::internal::GetCapturedStderr();
  EXPECT_NE(output.find(" 2 LogTest.Default: to stderr\n"), std::string::npos) << output;
  EXPECT_TRUE(lines_.empty());
}

TEST_F(LogTest, ConcurrentLinesAllArrive) {
  const StaticLogger logger("LogTest.Threads");
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&logger] {
      for (int i = 0; i < 250; ++i) {
        LogInternal(logger, 1, "line %1", {i});
      }
    });
  }
  for (auto& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(lines_.size(), 1000U);
}

TEST_F(LogTest, ReplacedSinkHasEndedOnAllThreads) {
  const StaticLogger logger("LogTest.Replaced");
  std::promise<void> entered;
  std::promise<void> mayLeave;
  std::atomic<bool> isInSink{false};
  auto owned = std::make_shared<int>();
  const std::weak_ptr<int> ownedBySink = owned;
  SetLogSink([&, owned = std::move(owned)](const LogRecord&) {
    isInSink = true;
    entered.set_value();
    mayLeave.get_future().wait();
    isInSink = false;
  });
  std::thread writer([&] { LogInternal(logger, 1, "line", {}); });
  entered.get_future().wait();

  std::atomic<int> newLines{0};
  bool hasEnded = false;
  std::thread replacer([&] {
    SetLogSink([&](const LogRecord&) { ++newLines; });
    hasEnded = !isInSink && ownedBySink.expired();
  });
  // New lines do not wait for the replaced sink. The replacing thread has time to return too early.
  while (newLines < 1000) {
    LogInternal(logger, 1, "line", {});
    std::this_thread::yield();
  }
  mayLeave.set_value();
  replacer.join();
  writer.join();
  EXPECT_TRUE(hasEnded);
}

TEST_F(LogTest, ConcurrentLinesReachNoReplacedSink) {
  const StaticLogger logger("LogTest.Replacing");
  std::atomic<bool> isDone{false};
  std::atomic<int> linesTooLate{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 3; ++t) {
    threads.emplace_back([&] {
      while (!isDone) {
        LogInternal(logger, 1, "line", {});
      }
    });
  }
  std::deque<std::atomic<bool>> isCurrent;  // outlives the lines that come too late
  for (int i = 0; i < 60; ++i) {
    auto& isThisCurrent = isCurrent.emplace_back(true);
    SetLogSink([&](const LogRecord&) {
      std::this_thread::yield();
      linesTooLate += isThisCurrent ? 0 : 1;
    });
    std::this_thread::yield();
    SetLogSink([](const LogRecord&) {});
    isThisCurrent = false;
  }
  isDone = true;
  for (auto& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(linesTooLate, 0);
}

TEST_F(LogTest, SinkMayReplaceItselfAndIsDestroyedAfterItsCall) {
  const StaticLogger logger("LogTest.Self");
  auto owned = std::make_shared<std::string>("still there");
  const std::weak_ptr<std::string> ownedBySink = owned;
  std::string seen;
  SetLogSink([&, owned = std::move(owned)](const LogRecord& record) {
    if (record.text == "outer") {
      LogInternal(logger, 1, "inner", {});
      seen += ", " + *owned;
      return;
    }
    SetLogSink([this](const LogRecord&) { lines_.emplace_back(); });
    LogInternal(logger, 1, "to the new sink", {});
    seen = *owned;
  });
  LogInternal(logger, 1, "outer", {});
  EXPECT_EQ(seen, "still there, still there");
  EXPECT_EQ(lines_.size(), 1U);
  EXPECT_TRUE(ownedBySink.expired());
}

TEST_F(LogTest, SinksMayReplaceThemselvesOnSeveralThreadsAtOnce) {
  const StaticLogger logger("LogTest.SelfThreads");
  constexpr int kThreads = 4;
  std::atomic<int> inside{0};
  SetLogSink([&](const LogRecord&) {
    ++inside;
    while (inside < kThreads) {
      std::this_thread::yield();
    }
    SetLogSink({});
  });
  std::vector<std::thread> threads;
  for (int t = 0; t < kThreads; ++t) {
    threads.emplace_back([&logger] { LogInternal(logger, 1, "line", {}); });
  }
  for (auto& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(inside, kThreads);
}

}  // namespace
}  // namespace Tarnik::Testing
