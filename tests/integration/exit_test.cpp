#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include "integration/sts_fixture.h"

namespace SsoClient::Testing {
namespace {

class TemporaryFile {
 public:
  explicit TemporaryFile(const std::string& content) {
    char name[] = "/tmp/ssoclient-test-XXXXXX";
    close(mkstemp(name));
    path_ = name;
    std::ofstream(path_) << content;
  }
  ~TemporaryFile() { std::remove(path_.c_str()); }
  TemporaryFile(const TemporaryFile&) = delete;
  TemporaryFile& operator=(const TemporaryFile&) = delete;

  const std::string& Path() const { return path_; }

 private:
  std::string path_;
};

/// Runs the program and returns the status from waitpid.
int RunToEnd(std::vector<std::string> command) {
  std::vector<char*> arguments;
  for (auto& word : command) {
    arguments.push_back(word.data());
  }
  arguments.push_back(nullptr);
  pid_t child = 0;
  if (posix_spawn(&child, arguments[0], nullptr, nullptr, arguments.data(), environ) != 0) {
    return -1;
  }
  int status = -1;
  waitpid(child, &status, 0);
  return status;
}

class ExitTest : public StsTest {};

TEST_F(ExitTest, ProcessMayExitWhileAsyncCallsAreUnderWay) {
  const TemporaryFile ca(Sts().CaCertificatePem());
  const TemporaryFile signing(Sts().SigningCertificatePem());
  for (const int microseconds : {0, 500, 2000, 5000, 10000, 20000, 40000, 80000, 160000, 320000}) {
    const auto start = std::chrono::steady_clock::now();
    const int status = RunToEnd(
        {EXIT_PROBE, Sts().HttpsUrl(), ca.Path(), signing.Path(), std::to_string(microseconds)});
    EXPECT_TRUE(WIFEXITED(status)) << "after " << microseconds << " us: " << status;
    EXPECT_EQ(WEXITSTATUS(status), 0) << "after " << microseconds << " us";
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(30));
  }
}

TEST_F(ExitTest, ProcessMayExitWhileTheServiceIsSilent) {
  const TemporaryFile ca(Sts().CaCertificatePem());
  const TemporaryFile signing(Sts().SigningCertificatePem());
  DevSts::Misbehavior silent;
  silent.stall = DevSts::Stall::BeforeAnswer;
  Sts().SetMisbehavior(silent);
  const auto start = std::chrono::steady_clock::now();
  const int status = RunToEnd({EXIT_PROBE, Sts().HttpsUrl(), ca.Path(), signing.Path(), "300000"});
  EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << status;
  EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(30));
}

}  // namespace
}  // namespace SsoClient::Testing
