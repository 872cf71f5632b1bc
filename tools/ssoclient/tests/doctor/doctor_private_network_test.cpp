// Findings about DNS, routes and the files of the system, each produced for real in a network or
// with files that only the program has.
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/x509.h>

#include "devsts/server.h"
#include "support/doctor_run.h"
#include "support/private_network.h"
#include "support/temporary_file.h"

namespace SsoClient::Tool::Testing {
namespace {

using Tarnik::Testing::TemporaryFile;
using testing::HasSubstr;

// RFC 5737: no machine has this address.
constexpr const char* kElsewhere = "https://192.0.2.1/sts";

class DoctorPrivateNetworkTest : public testing::Test {
 protected:
  void SetUp() override {
    static const std::string obstacle = PrivateNetworkObstacle();
    if (!obstacle.empty()) {
      ASSERT_FALSE(DoesSystemPermitPrivateNetworks()) << obstacle;
      GTEST_SKIP() << obstacle;
    }
  }

  static DoctorRun Run(const PrivateNetwork& network, const std::string& url,
                       const std::vector<std::string>& arguments = {}) {
    ToolOptions options;
    options.arguments = {"doctor", "--json", "--url", url};
    options.arguments.insert(options.arguments.end(), arguments.begin(), arguments.end());
    options.environment = {{"RESOLV_MULTI", "on"}};  // several addresses in /etc/hosts
    options.prepare = EnterPrivateNetwork(network);
    return DoctorRun(options);
  }

  static DoctorRun RunWith(NameServer server, const std::vector<std::string>& arguments = {}) {
    PrivateNetwork network;
    network.nameServer = server;
    return Run(network, "https://sts.example/sts", arguments);
  }

  static DoctorRun RunWith(Route route) {
    PrivateNetwork network;
    network.route = route;
    return Run(network, kElsewhere);
  }
};

TEST_F(DoctorPrivateNetworkTest, AnUnknownHostIsFound) {
  for (const NameServer server : {NameServer::kNoSuchName, NameServer::kEmpty}) {
    const DoctorRun run = RunWith(server);
    ExpectFailure(run, "dns", "unknown-host", 3, "tcp");
    EXPECT_THAT(run.Message("dns"), HasSubstr("sts.example"));
  }
}

TEST_F(DoctorPrivateNetworkTest, AMissingNameServerIsFound) {
  ExpectFailure(RunWith(NameServer::kNone), "dns", "no-name-server", 3, "tcp");
  ExpectFailure(RunWith(NameServer::kRefusal), "dns", "no-name-server", 3, "tcp");
}

TEST_F(DoctorPrivateNetworkTest, ASilentNameServerTakesOnlyAThirdOfTheTime) {
  const DevSts::Server sts;
  const TemporaryFile ca(sts.CaCertificatePem());
  const DoctorRun run = RunWith(NameServer::kSilent, {"--timeout", "0.9", "--ca", ca.Path()});
  ExpectFailure(run, "dns", "dns-timed-out", 3, "tcp");
  EXPECT_GE(run.DurationMs("dns"), 290);
}

TEST_F(DoctorPrivateNetworkTest, EachErrorOfTheNetworkIsFound) {
  ExpectFailure(RunWith(Route::kMissing), "tcp", "network-unreachable", 3, "tls");
  ExpectFailure(RunWith(Route::kUnreachable), "tcp", "host-unreachable", 3, "tls");
  const DoctorRun prohibited = RunWith(Route::kProhibited);
  ExpectFailure(prohibited, "tcp", "tcp-failed", 3, "tls");
  EXPECT_THAT(prohibited.Message("tcp"), HasSubstr("Permission denied"));
}

TEST_F(DoctorPrivateNetworkTest, AnAddressThatRefusesIsAWarning) {
  const DevSts::Server sts;
  const TemporaryFile ca(sts.CaCertificatePem());
  PrivateNetwork network;
  network.isSeparate = false;
  network.hosts = "127.0.0.1 localhost\n127.0.0.77 localhost\n";
  const DoctorRun run = Run(network, sts.HttpsUrlFor("localhost"), {"--ca", ca.Path(), "--strict"});
  ExpectWarning(run, "tcp", "some-addresses-fail");
  EXPECT_EQ(run.FirstCause(), "some-addresses-fail") << run.Text();
  EXPECT_EQ(run.Finding("sts"), "ok");
  EXPECT_EQ(run.Status(), 3);
}

TEST_F(DoctorPrivateNetworkTest, ASystemWithoutCasIsFound) {
  PrivateNetwork network;
  network.emptyFolder = X509_get_default_cert_area();
  const DoctorRun run = Run(network, kElsewhere);
  ExpectFailure(run, "trust", "trust-unusable", 4, "certificate");
  EXPECT_THAT(run.Remedy("trust"), HasSubstr("--ca"));
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
