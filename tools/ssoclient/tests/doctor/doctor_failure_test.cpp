// Findings about services and machines that fail between two steps, each produced for real.
#include <atomic>
#include <fstream>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <poll.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include "devsts/server.h"
#include "support/doctor_run.h"
#include "support/peer.h"
#include "support/refused_call.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"

namespace SsoClient::Tool::Testing {
namespace {

using Tarnik::Testing::Identity;
using Tarnik::Testing::TemporaryFile;
using testing::HasSubstr;

const Identity& Authority() {
  static const Identity identity = Tarnik::Testing::MakeCa("authority");
  return identity;
}

// Examines a service that accepts this many connections, with TLS.
DoctorRun RunWithConnections(int accepted) {
  const Identity server = Tarnik::Testing::MakeIdentity(
      {.dnsNames = {}, .addresses = {"127.0.0.1"}, .notAfter = 100L * 24 * 3600}, &Authority());
  const TemporaryFile ca(Authority().Pem());
  std::atomic<const Peer*> self = nullptr;
  int count = 0;
  const Peer::Serve serve = TlsPeer(server.Pem(), server.KeyPem());
  const Peer peer([&](int descriptor) {
    // Before the handshake, which the tool waits for.
    if (++count == accepted) {
      self.load()->StopListening();
    }
    serve(descriptor);
  });
  self = &peer;
  return RunDoctor(peer.Url(), {"--ca", ca.Path()});
}

TEST(DoctorFailureTest, AServiceThatEndsAfterTheProbeIsFound) {
  constexpr int kProbes = 2;  // of TCP and of TLS
  ExpectFailure(RunWithConnections(kProbes), "certificate", "library-cannot-connect", 3, "http");
}

TEST(DoctorFailureTest, AServiceThatEndsBeforeTheRequestIsFound) {
  constexpr int kProbesAndTheLibrary = 3;
  const DoctorRun run = RunWithConnections(kProbesAndTheLibrary);
  EXPECT_NE(run.Outcome("certificate"), "failed") << run.Text();
  ExpectFailure(run, "http", "http-failed", 3, "sts");
  EXPECT_THAT(run.Message("http"), HasSubstr("the exchange failed: "));
}

// A service with a login of alice, and what a run needs.
struct Service {
  DevSts::Server sts{};
  TemporaryFile ca{sts.CaCertificatePem()};

  ToolOptions Run(const std::vector<std::string>& arguments) const {
    ToolOptions options;
    options.arguments = {"doctor", "--json", "--url", sts.HttpsUrl(), "--ca", ca.Path()};
    options.arguments.insert(options.arguments.end(), arguments.begin(), arguments.end());
    return options;
  }
};

TEST(DoctorFailureTest, ALoginThatCannotBeWrittenIsFound) {
  const Service service;
  ToolOptions options = service.Run({"--user", "a\x01z", "--password-fd", "5"});
  options.descriptors = {{5, "secret\n"}};
  ExpectFailure(DoctorRun(options), "login", "login-failed", 4, "token");
  EXPECT_EQ(service.sts.Requests().size(), 1U);  // the harmless one
}

TEST(DoctorFailureTest, TooFewResourcesAreFound) {
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
  GTEST_SKIP() << "sanitizers need descriptors";
#endif
  const Service service;
  ToolOptions options = service.Run({});
  options.prepare = [] {
    close_range(STDERR_FILENO + 1, ~0U, CLOSE_RANGE_CLOEXEC);
    constexpr rlim_t kDescriptors = 4;  // one besides the standard streams
    const rlimit few{.rlim_cur = kDescriptors, .rlim_max = kDescriptors};
    setrlimit(RLIMIT_NOFILE, &few);
  };
  const DoctorRun run(options);
  EXPECT_EQ(run.FirstCause(), "local-failure") << run.Text();
  EXPECT_EQ(run.Status(), 4);
}

TEST(DoctorFailureTest, AThreadPoolThatCannotStartIsFound) {
  const Service service;
  ToolOptions options = service.Run({});
  options.prepare = [] { RefuseSystemCall(__NR_epoll_create1); };  // which event loops need
  const DoctorRun run(options);
  ExpectFailure(run, "certificate", "local-failure", 4, "http");
  EXPECT_THAT(run.Message("certificate"), HasSubstr("Too many open files"));
}

// Certificates that come from a pipe after the time of the whole examination is over.
TEST(DoctorFailureTest, AnExaminationWithoutTimeSaysSo) {
  const Service service;
  const Tarnik::Testing::TemporaryFolder folder;
  const std::string path = folder.Path() + "/pipe";
  ASSERT_EQ(mkfifo(path.c_str(), S_IRUSR | S_IWUSR), 0);
  ToolOptions options = service.Run({"--sts-certificate", path, "--timeout", "0.1"});
  std::thread writer([&] {
    std::ofstream pipe(path);  // opened when the tool opens it
    pollfd none{-1, 0, 0};
    constexpr int kMilliseconds = 150;
    poll(&none, 1, kMilliseconds);
    pipe << service.sts.SigningCertificatePem();
  });
  const DoctorRun run(options);
  writer.join();
  ExpectFailure(run, "credentials", "out-of-time", 3, "login");
  EXPECT_THAT(run.Remedy("credentials"), HasSubstr("--timeout"));
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
