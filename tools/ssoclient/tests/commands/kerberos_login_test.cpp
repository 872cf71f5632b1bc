#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "support/kerberos_service.h"
#include "support/service_fixture.h"

namespace SsoClient::Tool::Testing {
namespace {

using testing::HasSubstr;

constexpr const char* kService = KerberosService::kService;

class KerberosLoginTest : public ServiceTest {
 protected:
  KerberosLoginTest() {
    WritePrivate("ca.pem", KerberosService::Shared().Sts().CaCertificatePem());
    WritePrivate("sts.pem", KerberosService::Shared().Sts().SigningCertificatePem());
  }

  ToolResult LogInByKerberos(const std::vector<std::string>& arguments) const {
    ToolOptions options;
    options.arguments = Joined({"login", "--url", KerberosService::Shared().Sts().HttpsUrl(),
                                "--ca", PathOf("ca.pem"), "--sts-certificate", PathOf("sts.pem"),
                                "--kerberos", "--json", "--output", PathOf("token")},
                               arguments);
    options.environment = KerberosService::Shared().Environment();
    return RunTool(options);
  }
};

TEST_F(KerberosLoginTest, LogsInWithTheTicketsOfACache) {
  const ToolResult result =
      LogInByKerberos({"--service", kService, "--ccache", KerberosService::Shared().AliceCache()});
  ASSERT_EQ(result.status, 0) << result.out << result.err;
  EXPECT_EQ(result.Json()["token"]["subject"]["name"], "alice");
}

TEST_F(KerberosLoginTest, LogsInWithAKeytab) {
  const ToolResult result =
      LogInByKerberos({"--service", kService, "--principal", "machine", "--keytab",
                       KerberosService::Shared().MachineKeytab()});
  ASSERT_EQ(result.status, 0) << result.out << result.err;
  EXPECT_EQ(result.Json()["token"]["subject"]["name"], "machine");
}

TEST_F(KerberosLoginTest, WithoutTicketsItIsAFailureOfThisMachine) {
  const ToolResult result = LogInByKerberos({"--service", kService});
  EXPECT_EQ(result.status, 4);
  EXPECT_EQ(result.Json()["error"]["kind"], "kerberos");
  EXPECT_THAT(result.Json()["error"]["remedy"].get<std::string>(), HasSubstr("kinit"));
}

TEST_F(KerberosLoginTest, AMalformedServiceIsAWrongCommandLine) {
  const ToolResult result = LogInByKerberos({"--service", "sts.example"});
  EXPECT_EQ(result.status, 2);
  EXPECT_EQ(result.Json()["error"]["kind"], "bad-service");
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
