#include "sts/async_call.h"

#include <chrono>
#include <cstdlib>
#include <functional>
#include <future>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <typeinfo>
#include <utility>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>

namespace SsoClient::Testing {
namespace {

struct Report {
  int result;
  std::string errorType;
  std::string message;
  std::thread::id thread;
};

// Runs `operation` asynchronously and waits for the one report.
Report RunAndWait(std::function<int()> operation) {
  auto promise = std::make_shared<std::promise<Report>>();
  auto future = promise->get_future();
  SyncToAsyncCall<int>(std::move(operation),
                       [promise](const int& result, const Tarnik::Exception* error) {
                         Report report = {result, "", "", std::this_thread::get_id()};
                         if (error != nullptr) {
                           report.errorType = typeid(*error).name();
                           report.message = error->Message();
                         }
                         promise->set_value(report);
                       });
  return future.get();
}

TEST(SyncToAsyncCallTest, ReportsAResultFromAnotherThread) {
  const auto report = RunAndWait([] { return 42; });
  EXPECT_EQ(report.result, 42);
  EXPECT_EQ(report.errorType, "");
  EXPECT_NE(report.thread, std::this_thread::get_id());
}

TEST(SyncToAsyncCallTest, ReportsAnyPlatformExceptionWithItsClass) {
  const auto expired =
      RunAndWait([]() -> int { throw PasswordExpiredException("Authentication failed: expired"); });
  EXPECT_EQ(expired.result, 0);
  EXPECT_EQ(expired.errorType, typeid(PasswordExpiredException).name());
  EXPECT_EQ(expired.message, "Authentication failed: expired");
  const auto argument = RunAndWait([]() -> int { throw Tarnik::InvalidArgumentException("bad"); });
  EXPECT_EQ(argument.errorType, typeid(Tarnik::InvalidArgumentException).name());
}

TEST(SyncToAsyncCallTest, RefusesAnEmptyCallbackAtTheCall) {
  bool ran = false;
  try {
    SyncToAsyncCall<int>(
        [&ran] {
          ran = true;
          return 1;
        },
        nullptr);
    FAIL();
  } catch (const Tarnik::InvalidArgumentException& error) {
    EXPECT_EQ(error.Message(), "The callback must not be empty.");
  }
  EXPECT_FALSE(ran);
}

TEST(SyncToAsyncCallTest, AnOperationMayWaitForAnother) {
  const auto report = RunAndWait([] { return RunAndWait([] { return 7; }).result + 1; });
  EXPECT_EQ(report.result, 8);
}

TEST(SyncToAsyncCallTest, DropsTheOperationWhenTheCallHasEnded) {
  auto held = std::make_shared<int>(1);
  auto gone = std::make_shared<std::promise<void>>();
  auto future = gone->get_future();
  std::shared_ptr<int> sentinel(held.get(), [held, gone](int*) { gone->set_value(); });
  held = nullptr;
  SyncToAsyncCall<int>([sentinel] { return *sentinel; },
                       [](const int&, const Tarnik::Exception*) {});
  sentinel = nullptr;
  EXPECT_EQ(future.wait_for(std::chrono::seconds(20)), std::future_status::ready);
}

using SyncToAsyncCallDeathTest = testing::Test;

TEST(SyncToAsyncCallDeathTest, OtherExceptionsLeaveTheWorkItem) {
  testing::GTEST_FLAG(death_test_style) = "threadsafe";
  EXPECT_DEATH(RunAndWait([]() -> int { throw std::runtime_error("not the platform's"); }),
               "not the platform's");
}

TEST(SyncToAsyncCallDeathTest, WhatTheCallbackThrowsIsNotReportedToItAgain) {
  testing::GTEST_FLAG(death_test_style) = "threadsafe";
  EXPECT_DEATH(
      {
        SyncToAsyncCall<int>([] { return 1; },
                             [](const int&, const Tarnik::Exception* error) {
                               if (error == nullptr) {
                                 throw SsoException("from the callback");
                               }
                               std::_Exit(0);
                             });
        std::promise<void>().get_future().wait_for(std::chrono::seconds(20));
      },
      "from the callback");
}

}  // namespace
}  // namespace SsoClient::Testing
