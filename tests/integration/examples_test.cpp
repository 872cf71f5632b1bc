// The examples that read a token from a file or give up, and their status.
#include <string>

#include <gmock/gmock.h>

#include "integration/sts_fixture.h"
#include "support/child_process.h"
#include "support/temporary_file.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Testing::CommandResult;
using testing::HasSubstr;
using testing::StartsWith;

/// The output is that of both streams.
CommandResult RunExample(const std::string& command) {
  return Tarnik::Testing::RunInShell(EXAMPLES_FOLDER "/" + command + " 2>&1");
}

class ExamplesTest : public StsTest {
 protected:
  const Tarnik::Testing::TemporaryFolder folder_;
  std::string ca_ = folder_.Write("ca.pem", Sts().CaCertificatePem());
  std::string signing_ = folder_.Write("signing.pem", Sts().SigningCertificatePem());
};

TEST_F(ExamplesTest, CheckTokenRefusesBearerTokensOfPeersWithACertificate) {
  const auto bearer = Service()->AcquireToken(kUser, kPassword, TenMinutes());
  const auto file = folder_.Write("token.xml", bearer->Xml());
  const CommandResult run =
      RunExample("check_token " + signing_ + " " + file + " " + signing_ + " here");
  EXPECT_EQ(run.status, 1);
  EXPECT_EQ(run.output, "refused: the token is not bound to the peer's key\n");
  // The token itself is good.
  EXPECT_EQ(
      RunExample("check_token_by_issuer " + file + " " + bearer->Issuer() + " " + signing_).status,
      0);
}

TEST_F(ExamplesTest, TokenFilesThatCannotBeReadAreFailures) {
  const std::string missing = "/nonexistent/token.xml";
  const std::string service = Sts().HttpsUrl() + " " + ca_ + " " + signing_ + " ";
  const std::string check = "check_token " + signing_ + " ";
  for (const std::string& command : {
           check + missing + " " + signing_ + " here",
           "check_token_by_issuer " + missing + " issuer " + signing_,
           "validate_token " + service + missing,
           "keep_connections " + service + missing,
       }) {
    const CommandResult run = RunExample(command);
    EXPECT_GT(run.status, 0) << command;
    EXPECT_THAT(run.output, HasSubstr("cannot read " + missing)) << command;
  }
  const CommandResult folder = RunExample(check + "/tmp " + signing_ + " here");
  EXPECT_EQ(folder.status, 1);
  EXPECT_THAT(folder.output, StartsWith("refused: "));
}

TEST_F(ExamplesTest, KeepConnectionsFailsIfOneOfTheTokensIsInvalid) {
  const auto revoked = Service()->AcquireToken(kUser, kPassword, TenMinutes());
  const auto valid = Service()->AcquireToken(kUser, kPassword, TenMinutes());
  const auto revokedFile = folder_.Write("revoked.xml", revoked->Xml());
  const auto validFile = folder_.Write("valid.xml", valid->Xml());
  ASSERT_TRUE(Sts().Revoke(revoked->Id()));
  const std::string command = "keep_connections " + Sts().HttpsUrl() + " " + ca_ + " " + signing_;
  const CommandResult good = RunExample(command + " " + validFile + " " + validFile);
  EXPECT_EQ(good.output, "valid: " + validFile + "\nvalid: " + validFile + "\n");
  EXPECT_EQ(good.status, 0);
  const CommandResult run = RunExample(command + " " + revokedFile + " " + validFile);
  EXPECT_EQ(run.output, "INVALID: " + revokedFile + "\nvalid: " + validFile + "\n");
  EXPECT_EQ(run.status, 1);
}

TEST_F(ExamplesTest, LimitACallGivesUpOnlyAtItsDeadline) {
  const std::string command = "limit_a_call " + Sts().HttpsUrl() + " " + ca_ + " " + signing_ + " ";
  const std::string login = kUser + (" <" + folder_.Write("password", kPassword));
  EXPECT_EQ(RunExample(command + login).status, 0);

  // Nothing trusts the certificate of the service.
  const CommandResult untrusted = RunExample("limit_a_call " + Sts().HttpsUrl() + " " + signing_ +
                                             " " + signing_ + " " + login);
  EXPECT_THAT(untrusted.output, StartsWith("No token: TLS handshake with "));
  EXPECT_EQ(untrusted.status, 1);

  DevSts::Misbehavior silent;
  silent.stall = DevSts::Stall::BeforeAnswer;
  Sts().SetMisbehavior(silent);
  const CommandResult late = RunExample(command + login);
  EXPECT_THAT(late.output, StartsWith("given up: The caller's deadline has passed. "));
  EXPECT_EQ(late.status, 3);
}

}  // namespace
}  // namespace SsoClient::Testing
