#include <filesystem>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>
#include <sys/stat.h>

#include "support/kerberos_service.h"
#include "support/service_fixture.h"

namespace SsoClient::Tool::Testing {
namespace {

using testing::HasSubstr;

constexpr const char* kService = "HTTP@sts.example";

class KerberosLoginTest : public ServiceTest {
 protected:
  KerberosLoginTest() {
    WritePrivate("ca.pem", TheKerberos().sts->CaCertificatePem());
    WritePrivate("sts.pem", TheKerberos().sts->SigningCertificatePem());
  }

  ToolResult LogInByKerberos(const std::vector<std::string>& arguments) const {
    ToolOptions options;
    options.arguments = Joined({"login", "--url", TheKerberos().sts->HttpsUrl(), "--ca",
                                PathOf("ca.pem"), "--sts-certificate", PathOf("sts.pem"),
                                "--kerberos", "--json", "--output", PathOf("token")},
                               arguments);
    options.environment["KRB5_CONFIG"] = TheKerberos().realm.ConfigPath();
    options.environment["KRB5CCNAME"] = "FILE:" + PathOf("none");
    return RunTool(options);
  }
};

TEST_F(KerberosLoginTest, LogsInWithTheTicketsOfACache) {
  const ToolResult result =
      LogInByKerberos({"--service", kService, "--ccache", TheKerberos().aliceCache});
  ASSERT_EQ(result.status, 0) << result.out << result.err;
  EXPECT_EQ(result.Json()["token"]["subject"]["name"], "alice");
  EXPECT_EQ(result.err, "");  // nothing that looks like a failure
}

TEST_F(KerberosLoginTest, LogsInWithAKeytab) {
  const ToolResult result = LogInByKerberos(
      {"--service", kService, "--principal", "machine", "--keytab", TheKerberos().machineKeytab});
  ASSERT_EQ(result.status, 0) << result.out << result.err;
  EXPECT_EQ(result.Json()["token"]["subject"]["name"], "machine");
}

TEST_F(KerberosLoginTest, AKeytabIsAPrivateFile) {
  const std::string keytab = PathOf("machine.keytab");
  std::filesystem::copy_file(TheKerberos().machineKeytab, keytab);
  chmod(keytab.c_str(), 0600);
  const std::vector<std::string> login{"--service", kService, "--principal", "machine", "--keytab"};
  EXPECT_EQ(LogInByKerberos(Joined(login, {"FILE:" + keytab})).status, 0);

  chmod(keytab.c_str(), 0640);
  for (const std::string& name : {keytab, "FILE:" + keytab}) {
    const ToolResult result = LogInByKerberos(Joined(login, {name}));
    EXPECT_EQ(result.status, 4);
    EXPECT_EQ(result.Json()["error"]["kind"], "keytab-file-open") << result.out;
    EXPECT_EQ(LogInByKerberos(Joined(login, {name, "--allow-open-files"})).status, 0);
  }
  const ToolResult missing = LogInByKerberos(Joined(login, {PathOf("none")}));
  EXPECT_EQ(missing.status, 4);
  EXPECT_EQ(missing.Json()["error"]["kind"], "keytab-file");
  const ToolResult other = LogInByKerberos(Joined(login, {"MEMORY:keys"}));
  EXPECT_EQ(other.status, 2);
  EXPECT_THAT(other.out, HasSubstr("--keytab: it must be a file"));
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
