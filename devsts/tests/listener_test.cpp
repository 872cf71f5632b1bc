#include "wire/listener.h"

#include <cerrno>
#include <chrono>
#include <future>
#include <string>
#include <system_error>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>
#include <unistd.h>

#include "devsts/server.h"
#include "raw_client.h"
#include "replaced_calls.h"

namespace DevSts::Testing {
namespace {

using std::chrono::milliseconds;
using std::chrono::seconds;
using testing::Each;
using testing::Ge;
using testing::MatchesRegex;
using testing::StartsWith;

// A listener that closes the connections that it accepts.
struct RunningListener {
  RunningListener()
      : listener(
            "127.0.0.1", 0, [](int socket) { close(socket); },
            [this](const std::string& message) { failure.set_value(message); }) {}

  std::promise<std::string> failure;
  Listener listener;
};

class PassingErrorTest : public testing::TestWithParam<int> {};

TEST_P(PassingErrorTest, DoesNotEndTheListener) {
  const AcceptErrors errors(AF_INET, {GetParam()});
  RunningListener run;
  EXPECT_EQ(RawClient(run.listener.Port()).ReadToEnd(), "");
  EXPECT_EQ(run.failure.get_future().wait_for(seconds(0)), std::future_status::timeout);
}

INSTANTIATE_TEST_SUITE_P(EachError, PassingErrorTest,
                         testing::Values(EINTR, ECONNABORTED, EPROTO, ENETDOWN, EHOSTUNREACH,
                                         EMFILE, ENFILE, ENOBUFS, ENOMEM, EPERM),
                         [](const auto& test) { return "Errno" + std::to_string(test.param); });

TEST(ListenerTest, PausesWhileDescriptorsOrMemoryAreMissing) {
  const AcceptErrors errors(AF_INET, {EMFILE, ENFILE, ENOMEM, ENOBUFS});
  const RunningListener run;
  const auto times = AcceptErrors::AwaitTimes();
  ASSERT_EQ(times.size(), 4U);
  std::vector<milliseconds> pauses;
  for (std::size_t i = 1; i < times.size(); ++i) {
    pauses.push_back(std::chrono::duration_cast<milliseconds>(times[i] - times[i - 1]));
  }
  EXPECT_THAT(pauses, Each(Ge(milliseconds(20))));
}

TEST(ListenerTest, StopsDuringAPause) {
  const AcceptErrors errors(AF_INET, std::vector<int>(1000, EMFILE));
  const auto begin = std::chrono::steady_clock::now();
  { const RunningListener run; }
  EXPECT_LT(std::chrono::steady_clock::now() - begin, seconds(20));
}

TEST(ListenerTest, ReportsThatItCanAcceptNoMore) {
  for (const int error : {EBADF, EINVAL, ENOTSOCK}) {
    const AcceptErrors errors(AF_INET, {error});
    RunningListener run;
    std::future<std::string> failure = run.failure.get_future();
    ASSERT_EQ(failure.wait_for(seconds(30)), std::future_status::ready);
    EXPECT_THAT(failure.get(), StartsWith("port " + std::to_string(run.listener.Port()) +
                                          " accepts no more connections: "));
  }
}

TEST(ListenerTest, AServerReportsItToItsOwner) {
  const AcceptErrors errors(AF_INET, {EBADF});
  std::promise<std::string> failure;
  ServerOptions options;
  options.onFailure = [&](const std::string& message) { failure.set_value(message); };
  const Server server(std::move(options));
  std::future<std::string> reported = failure.get_future();
  ASSERT_EQ(reported.wait_for(seconds(30)), std::future_status::ready);
  EXPECT_THAT(reported.get(), MatchesRegex("port [0-9]+ accepts no more connections: .+"));
}

TEST(ListenerTest, FailsToStartWithoutAThread) {
  const NoThreads none;
  EXPECT_THROW(Listener("127.0.0.1", 0, close, [](const std::string&) {}), std::system_error);
}

}  // namespace
}  // namespace DevSts::Testing
