// Signals during a call of the service.
#include <csignal>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>
#include <sys/syscall.h>

#include "support/refused_call.h"
#include "support/service_fixture.h"

namespace SsoClient::Tool::Testing {
namespace {

class ServiceCallTest : public ServiceTest {
 protected:
  // Runs the command against a service that does not answer, and sends it the signal while it
  // waits.
  static ToolResult Interrupt(const std::vector<std::string>& arguments, int signal) {
    DevSts::Misbehavior silent;
    silent.stall = DevSts::Stall::BeforeAnswer;
    Sts().SetMisbehavior(silent);
    const auto before = Sts().GetCounters().stalls;
    ToolOptions options;
    options.arguments = arguments;
    ToolProcess tool(options);
    EXPECT_TRUE(
        Sts().WaitUntil([before](const auto& counters) { return counters.stalls > before; }));
    tool.Signal(signal);
    return tool.Finish();
  }
};

TEST_F(ServiceCallTest, ASignalEndsTheProcessAndNothingIsWritten) {
  const std::vector<std::string> before = FilesInFolder();
  for (const int signal : {SIGTERM, SIGHUP, SIGINT}) {
    const ToolResult result = Interrupt(PasswordLogin({"-o", PathOf("token")}), signal);
    EXPECT_EQ(result.signal, signal);
    EXPECT_EQ(result.out, "");
    EXPECT_EQ(result.err, "");
    EXPECT_EQ(FilesInFolder(), before);
  }
}

TEST_F(ServiceCallTest, ASignalDuringARenewalLeavesTheToken) {
  const std::string path = LogIn("token", KeyLogin({"--renewable"}));
  const std::string token = Content(path);
  const std::vector<std::string> before = FilesInFolder();
  EXPECT_EQ(Interrupt(Command("renew", Joined(Key(), {path})), SIGTERM).signal, SIGTERM);
  EXPECT_EQ(Content(path), token);
  EXPECT_EQ(FilesInFolder(), before);
}

TEST_F(ServiceCallTest, ACallThatCannotBeWaitedForIsNotMade) {
  const std::vector<std::string> before = FilesInFolder();
  const auto requests = Sts().Requests().size();
  const auto logInWithout = [&](void (*refuse)()) {
    ToolOptions options;
    options.arguments = PasswordLogin({"--json", "-o", PathOf("token")});
    options.prepare = refuse;
    const ToolResult result = RunTool(options);
    EXPECT_EQ(result.status, 4) << result.err;
    return result.Json()["error"]["message"].get<std::string>();
  };
  EXPECT_EQ(logInWithout([] { RefuseSystemCall(__NR_signalfd4); }),
            "cannot wait for signals: Too many open files");
  EXPECT_EQ(logInWithout([] { RefuseSystemCall(__NR_eventfd2); }),
            "cannot wait for the service: Too many open files");
  EXPECT_EQ(Sts().Requests().size(), requests);
  EXPECT_EQ(FilesInFolder(), before);
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
