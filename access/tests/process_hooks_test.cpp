#include "process_hooks.h"

#include <array>
#include <atomic>
#include <cstdlib>
#include <functional>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <ssoclient/exceptions.h>

#include "support/source_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

std::atomic<bool> isCallerBlocked{false};

// The functions of the program itself run at the end of exit, after those of atexit.
__attribute__((destructor)) void WaitForTheCaller() {
  while (isCallerBlocked) {
    std::this_thread::yield();
  }
}

class ProcessHooksTest : public SourceFixture {
 protected:
  // What a child writes to the descriptor that `body` gets, until it ends.
  static std::string OutputOfChild(const std::function<void(int)>& body) {
    std::array<int, 2> ends{};
    EXPECT_EQ(pipe(ends.data()), 0);
    const pid_t child = fork();
    if (child == 0) {
      alarm(30);
      body(ends[1]);
      _exit(9);
    }
    close(ends[1]);
    std::string output;
    char byte = 0;
    while (read(ends[0], &byte, 1) == 1) {
      output += byte;
    }
    close(ends[0]);
    int status = -1;
    waitpid(child, &status, 0);
    EXPECT_TRUE(WIFEXITED(status));
    return output + " " + std::to_string(WEXITSTATUS(status));
  }

  // With the pool of the platform, and endpoints that are silent until they are cancelled.
  std::shared_ptr<TokenSourceImpl> MakeWithPool() {
    const auto shared = std::make_shared<const TokenSourceConfig>(config);
    ForAll([](const AttemptRequest&, Tarnik::Http::CallLimit& limit) {
      while (!limit.IsCancelled()) {
        std::this_thread::yield();
      }
      return Unreachable();
    });
    return std::make_shared<TokenSourceImpl>([shared, scripts = scripts] {
      Core::Parts parts{shared, CreateSystemRuntime(), {}};
      parts.clients.push_back(std::make_unique<ScriptedEndpoint>(shared->endpoints[0], scripts[0]));
      return parts;
    });
  }

  // The same, which nothing destroys when the process exits.
  TokenSourceImpl& KeptWithPool() {
    static const auto* const kept = new std::shared_ptr<TokenSourceImpl>(MakeWithPool());
    return **kept;
  }

  static void Write(int descriptor, const std::string& text) {
    EXPECT_EQ(write(descriptor, text.data(), text.size()), static_cast<ssize_t>(text.size()));
  }
};

TEST_F(ProcessHooksTest, GenerationDiffersInAChild) {
  const std::uint64_t own = ForkGeneration();
  EXPECT_EQ(OutputOfChild([own](int) { _exit(ForkGeneration() == own ? 1 : 0); }), " 0");
  EXPECT_EQ(ForkGeneration(), own);
}

TEST_F(ProcessHooksTest, EndOfTheProcessEndsTheCallsOfAllSources) {
  Make();
  const auto first = Ask(spec);
  auto firstSource = source;
  Make();
  const auto second = Ask(spec);
  runtime->DropWork();
  // No worker runs the callbacks, so they run when they are dropped.
  EndCoresOfProcess();
  runtime->DropWork();
  for (const auto& reply : {first, second}) {
    EXPECT_EQ(reply->calls, 1);
    EXPECT_TRUE(reply->Is<CommunicationException>());
    EXPECT_EQ(reply->Message(), "The process is ending.");
  }
  EXPECT_THROW(firstSource->GetToken(spec, {}), CommunicationException);
}

TEST_F(ProcessHooksTest, ExitWithCallsUnderWayReportsEachOnce) {
  EXPECT_EQ(OutputOfChild([this](int descriptor) {
              TokenSourceImpl& kept = KeptWithPool();
              for (int i = 0; i < 3; ++i) {
                kept.GetTokenAsync(SpecFor(std::to_string(i)), {},
                                   [descriptor](const auto&, const Tarnik::Exception* failure) {
                                     Write(descriptor, "[" + failure->Message() + "]");
                                   });
              }
              std::exit(0);
            }),
            "[The process is ending.][The process is ending.][The process is ending.] 0");
}

TEST_F(ProcessHooksTest, SourcesShareTheWaitAtTheEnd) {
  constexpr int kSources = 10;
  // The callbacks of none of them run.
  std::vector<std::shared_ptr<TokenSourceImpl>> sources;
  std::vector<std::shared_ptr<Reply>> replies;
  for (int i = 0; i < kSources; ++i) {
    Make();
    replies.push_back(Ask(spec));
    sources.push_back(source);
  }
  const auto begun = std::chrono::steady_clock::now();
  EndCoresOfProcess();
  EXPECT_LT(std::chrono::steady_clock::now() - begun, milliseconds(200) * (kSources - 1));
  runtime->DropWork();
  for (const auto& reply : replies) {
    EXPECT_EQ(reply->calls, 1);
  }
}

TEST_F(ProcessHooksTest, ExitWakesABlockedCaller) {
  EXPECT_EQ(OutputOfChild([this](int descriptor) {
              isCallerBlocked = true;
              TokenSourceImpl& kept = KeptWithPool();
              std::thread([this, descriptor, &kept] {
                try {
                  kept.GetToken(spec, {});
                } catch (const CommunicationException& failure) {
                  Write(descriptor, failure.Message());
                }
                isCallerBlocked = false;
              }).detach();
              while (scripts[0]->Count() == 0) {
                std::this_thread::yield();
              }
              std::exit(0);
            }),
            "The process is ending. 0");
}

}  // namespace

}  // namespace SsoClient::Access::Testing
