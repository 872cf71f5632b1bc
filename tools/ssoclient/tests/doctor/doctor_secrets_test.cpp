// Findings about files that contain secrets, each produced for real.
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>
#include <sys/stat.h>

#include "support/doctor_run.h"
#include "support/key_texts.h"
#include "support/service_fixture.h"
#include "support/test_pki.h"

namespace SsoClient::Tool::Testing {
namespace {

using Tarnik::Testing::Identity;
using testing::HasSubstr;

constexpr const char* kAllow = "--allow-open-files";

class DoctorSecretsTest : public ServiceTest {
 protected:
  DoctorRun Run(const std::vector<std::string>& arguments) const {
    ToolOptions options;
    options.arguments = Joined(Command("doctor", {"--json"}), arguments);
    options.environment = {{"KRB5_CONFIG", "/dev/null"}};
    return DoctorRun(options);
  }

  /// Expects that the file is refused while others can read or change it, and accepted with
  /// --allow-open-files.
  void ExpectRefused(const std::string& file, const std::vector<std::string>& arguments,
                     const std::string& step, const std::string& finding) const {
    for (const mode_t mode : {S_IRGRP, S_IWGRP, S_IROTH, S_IWOTH}) {
      chmod(PathOf(file).c_str(), S_IRUSR | S_IWUSR | mode);
      const DoctorRun run = Run(arguments);
      ExpectFailure(run, step, finding, 4, "token");
      EXPECT_THAT(run.Remedy(step), HasSubstr("chmod 600"));
      EXPECT_THAT(run.Remedy(step), HasSubstr(kAllow));
    }
    EXPECT_NE(Run(Joined(arguments, {kAllow})).Finding(step), finding);
    chmod(PathOf(file).c_str(), S_IRUSR | S_IWUSR);
    EXPECT_NE(Run(arguments).Finding(step), finding);
  }
};

TEST_F(DoctorSecretsTest, AnOpenKeyIsRefused) {
  ExpectRefused("machine.key", Key(), "credentials", "key-file-open");
  // The name of the finding is the kind of the failure of other commands.
  chmod(PathOf("machine.key").c_str(), 0644);
  EXPECT_EQ(RunTool(KeyLogin({"--json", "--output", PathOf("token")})).Json()["error"]["kind"],
            "key-file-open");
  const DoctorRun run = Run(Joined(Key(), {kAllow}));
  EXPECT_EQ(run.Status(), 0) << run.Text();
  EXPECT_EQ(run.Finding("token"), "ok");
}

TEST_F(DoctorSecretsTest, AnOpenPasswordFileIsRefused) {
  ExpectRefused("password", {"--user", "alice@EXAMPLE.COM", "--password-file", PathOf("password")},
                "login", "password-file-open");
}

TEST_F(DoctorSecretsTest, AnOpenKeytabIsRefused) {
  WritePrivate("keytab", "rubbish");
  for (const std::string form : {"", "FILE:"}) {
    ExpectRefused("keytab", {"--kerberos", "--keytab", form + PathOf("keytab")}, "credentials",
                  "keytab-file-open");
  }
}

TEST_F(DoctorSecretsTest, APasswordFileThatIsMissingIsFound) {
  const DoctorRun run = Run({"--user", "alice@EXAMPLE.COM", "--password-file", "/nonexistent"});
  ExpectFailure(run, "login", "password-file", 4, "token");
}

TEST_F(DoctorSecretsTest, EachFaultOfAPassphraseIsFound) {
  const Identity identity = Tarnik::Testing::MakeIdentity({.rsaBits = 2048}, nullptr);
  const std::string passphrase = "open-sesame";
  const std::vector<std::string> key = {
      "--certificate", WritePrivate("c.pem", identity.Pem()), "--key",
      WritePrivate("c.key", Tarnik::Testing::ToPkcs8Pem(identity.key.get(), &passphrase))};
  ExpectFailure(Run(key), "credentials", "no-passphrase", 2, "login");
  const auto withFile = [&](const std::string& path) {
    return Joined(key, {"--passphrase-file", path});
  };
  ExpectFailure(Run(withFile(WritePrivate("empty", "\n"))), "credentials", "no-passphrase", 4,
                "login");
  ExpectFailure(Run(withFile("/nonexistent")), "credentials", "passphrase-file", 4, "login");
  ExpectFailure(Run(withFile(WritePrivate("wrong", "wrong\n"))), "credentials", "bad-key-file", 4,
                "login");
  WritePrivate("right", passphrase + "\n");
  ExpectRefused("right", withFile(PathOf("right")), "credentials", "passphrase-file-open");
}

TEST_F(DoctorSecretsTest, ACertificateWithoutAKeyIsFound) {
  ExpectFailure(Run({"--certificate", PathOf("machine.pem")}), "credentials", "no-key", 2, "login");
}

TEST_F(DoctorSecretsTest, AMalformedNameOfTheServiceIsFound) {
  ExpectFailure(Run({"--kerberos", "--service", "sts.example"}), "login", "bad-service", 2,
                "token");
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
