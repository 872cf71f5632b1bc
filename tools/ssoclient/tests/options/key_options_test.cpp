// The forms in which the key of a login can be.
#include <map>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <nlohmann/json.hpp>
#include <openssl/pkcs12.h>
#include <sys/stat.h>

#include "support/key_texts.h"
#include "support/service_fixture.h"
#include "support/test_pki.h"

namespace SsoClient::Tool::Testing {
namespace {

using Tarnik::Testing::Identity;
using testing::HasSubstr;
using testing::Not;

const std::string kPassphrase = "open-sesame";

const Identity& TheIdentity() {
  static const Identity identity =
      Tarnik::Testing::MakeIdentity({.commonName = "robot", .rsaBits = 2048}, nullptr);
  return identity;
}

std::string Pkcs12() {
  const Tarnik::OpenSsl::OwnedPkcs12 made(
      PKCS12_create(kPassphrase.c_str(), nullptr, TheIdentity().key.get(),
                    TheIdentity().certificate.get(), nullptr, 0, 0, 100, 100, 0));
  unsigned char* bytes = nullptr;
  const int length = i2d_PKCS12(made.get(), &bytes);
  const Tarnik::OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  return {reinterpret_cast<const char*>(bytes), static_cast<std::size_t>(length)};
}

class KeyOptionsTest : public ServiceTest {
 protected:
  KeyOptionsTest() {
    Sts().RegisterCertificate("bob@EXAMPLE.COM", TheIdentity().Pem());
    WritePrivate("robot.p12", Pkcs12());
    WritePrivate("robot.pem", TheIdentity().Pem());
    WritePrivate("robot.key", Tarnik::Testing::ToPkcs8Pem(TheIdentity().key.get(), &kPassphrase));
    WritePrivate("both.pem", Content(PathOf("robot.key")) + TheIdentity().Pem());
    WritePrivate("passphrase", kPassphrase + "\n");
    WritePrivate("wrong", "another\n");
  }

  ToolResult Run(const std::string& command, const std::vector<std::string>& key,
                 const std::string& passphrase) const {
    return RunTool(
        Command(command, Joined(key, {"--json", "--passphrase-file", PathOf(passphrase)})));
  }
  /// A login with a terminal at which it can ask for the passphrase of both.pem.
  ToolOptions TerminalLogin(const std::vector<std::string>& arguments) const {
    ToolOptions options;
    options.arguments = Command(
        "login", Joined({"--certificate", PathOf("both.pem"), "-o", PathOf("token")}, arguments));
    options.hasTerminal = true;
    options.err = Stream::kTerminal;
    return options;
  }
  void ExpectToReadPassphraseWithoutEcho(const ToolOptions& options) const {
    ToolProcess tool(options);
    ASSERT_TRUE(tool.WaitFor("Passphrase for " + PathOf("both.pem") + ": "));
    EXPECT_FALSE(tool.IsEchoing());
    tool.Type(kPassphrase + "\n");
    const ToolResult result = tool.Finish();
    EXPECT_EQ(result.status, 0) << result.terminal;
    EXPECT_THAT(result.terminal, Not(HasSubstr(kPassphrase)));
    EXPECT_THAT(Content(PathOf("token")), HasSubstr("bob"));
  }
  std::vector<std::vector<std::string>> Forms() const {
    return {{"--certificate", PathOf("robot.p12")},
            {"--certificate", PathOf("robot.pem"), "--key", PathOf("robot.key")},
            {"--certificate", PathOf("robot.pem"), "--key", PathOf("robot.p12")},
            {"--certificate", PathOf("both.pem")}};
  }
};

TEST_F(KeyOptionsTest, ALoginReadsEachFormWithItsPassphrase) {
  for (const auto& form : Forms()) {
    const ToolResult result = Run("login", Joined(form, {"-o", PathOf("token")}), "passphrase");
    ASSERT_EQ(result.status, 0) << result.out;
    EXPECT_EQ(result.Json()["token"]["subject"]["name"], "bob");
    EXPECT_EQ(result.Json()["token"]["confirmation"], "holder-of-key");
  }
}

TEST_F(KeyOptionsTest, AWrongPassphraseIsLocalAndNotRepeated) {
  for (const auto& form : Forms()) {
    const ToolResult result = Run("login", Joined(form, {"-o", PathOf("token")}), "wrong");
    EXPECT_EQ(result.status, 4);
    EXPECT_EQ(result.Json()["error"]["kind"], "key") << result.out;
    EXPECT_THAT(result.out + result.err, Not(HasSubstr("another")));
  }
  EXPECT_TRUE(Sts().Requests().empty());
}

TEST_F(KeyOptionsTest, APassphraseFileOfOthersIsRefused) {
  chmod(PathOf("passphrase").c_str(), 0644);
  const auto login = Joined(Forms().front(), {"-o", PathOf("token")});
  for (const ToolResult& result :
       {Run("login", login, "passphrase"), Run("doctor", Forms().front(), "passphrase")}) {
    EXPECT_EQ(result.status, 4);
    EXPECT_THAT(result.out, HasSubstr("\"passphrase-file-open\""));
  }
}

TEST_F(KeyOptionsTest, AsksForThePassphraseWithoutEcho) {
  ExpectToReadPassphraseWithoutEcho(TerminalLogin({}));
}

TEST_F(KeyOptionsTest, APassphraseFromADescriptorThatIsATerminalIsReadWithoutEcho) {
  ToolOptions options = TerminalLogin({"--passphrase-fd", "0"});
  options.in = Stream::kTerminal;
  ExpectToReadPassphraseWithoutEcho(options);
}

TEST_F(KeyOptionsTest, APassphraseIsTheFirstLineOfADescriptor) {
  ToolOptions options;
  options.arguments = Command("login", {"--json", "-o", PathOf("token"), "--certificate",
                                        PathOf("both.pem"), "--passphrase-fd", "7"});
  options.descriptors[7] = kPassphrase + "\nanother\n";
  const ToolResult right = RunTool(options);
  EXPECT_EQ(right.status, 0) << right.out;

  options.descriptors[7] = "another\n" + kPassphrase + "\n";
  const ToolResult wrong = RunTool(options);
  EXPECT_EQ(wrong.status, 4);
  EXPECT_EQ(wrong.Json()["error"]["kind"], "key") << wrong.out;
}

TEST_F(KeyOptionsTest, AKeyCanComeFromAPipe) {
  ToolOptions options;
  options.arguments = Command("login", {"--json", "-o", PathOf("token"), "--certificate",
                                        "/dev/fd/7", "--passphrase-file", PathOf("passphrase")});
  options.descriptors[7] = Content(PathOf("both.pem"));
  const ToolResult both = RunTool(options);
  EXPECT_EQ(both.status, 0) << both.out;

  options.arguments = Joined(options.arguments, {"--key", "/dev/fd/8"});
  options.descriptors = {{7, TheIdentity().Pem()}, {8, Content(PathOf("robot.key"))}};
  const ToolResult pair = RunTool(options);
  EXPECT_EQ(pair.status, 0) << pair.out;
}

// A URI must not be a way around the check of the file.
TEST_F(KeyOptionsTest, AFileIsNamedByItsPath) {
  for (const std::string scheme : {"file:", "file://", "FILE:", "file://localhost"}) {
    for (const std::string command : {"login", "doctor"}) {
      const ToolResult result = Run(
          command, {"--certificate", PathOf("robot.pem"), "--key", scheme + PathOf("robot.key")},
          "passphrase");
      EXPECT_EQ(result.status, 2) << result.out;
      EXPECT_EQ(result.Json()["error"]["kind"], "usage");
      EXPECT_THAT(result.out, HasSubstr("--key: name a file by its path"));
    }
  }
}

// Others can see the arguments of a process, and the failure names the key.
TEST_F(KeyOptionsTest, AUriWithThePinIsRefusedAndNotRepeated) {
  for (const std::string attribute : {"pin-value", "PIN-VALUE"}) {
    for (const std::string command : {"login", "doctor"}) {
      const ToolResult result = Run(command,
                                    {"--certificate", PathOf("robot.pem"), "--key",
                                     "pkcs11:object=me?" + attribute + "=482716"},
                                    "passphrase");
      EXPECT_EQ(result.status, 2) << result.out;
      EXPECT_THAT(result.out, HasSubstr("--key: it must not contain the PIN"));
      EXPECT_THAT(result.out + result.err, Not(HasSubstr("482716")));
    }
  }
}

TEST_F(KeyOptionsTest, AKeyFileThatOthersCanUseIsRefused) {
  const auto login = Joined(Forms()[1], {"-o", PathOf("token")});
  for (const mode_t mode : {0640U, 0620U, 0604U, 0602U}) {
    chmod(PathOf("robot.key").c_str(), mode);
    const ToolResult result = Run("login", login, "passphrase");
    EXPECT_EQ(result.status, 4) << mode;
    EXPECT_EQ(result.Json()["error"]["kind"], "key-file-open");
    EXPECT_EQ(Run("login", Joined(login, {"--allow-open-files"}), "passphrase").status, 0);
  }
  chmod(PathOf("robot.pem").c_str(), 0644);  // certificates are public
  chmod(PathOf("robot.key").c_str(), 0400);
  EXPECT_EQ(Run("login", login, "passphrase").status, 0);
}

TEST_F(KeyOptionsTest, DoctorLogsInWithWhatLoginAccepts) {
  for (const auto& form : Forms()) {
    const ToolResult result = Run("doctor", form, "passphrase");
    EXPECT_EQ(result.status, 0) << result.out;
    EXPECT_THAT(result.out, HasSubstr("bob@EXAMPLE.COM"));
    const ToolResult wrong = Run("doctor", form, "wrong");
    EXPECT_EQ(wrong.status, 4);
    EXPECT_EQ(wrong.Json()["firstCause"]["finding"], "bad-key-file") << wrong.out;
  }
}

TEST_F(KeyOptionsTest, DoctorFindsThatThereIsNoKey) {
  const ToolResult result = Run("doctor", {"--certificate", PathOf("robot.pem")}, "passphrase");
  EXPECT_EQ(result.status, 2);
  EXPECT_EQ(result.Json()["firstCause"]["finding"], "no-key");
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
