// The example that keeps a token fresh with a Kerberos login.
#include <string>

#include <gmock/gmock.h>

#include "negotiation/realm_fixture.h"
#include "support/child_process.h"
#include "support/temporary_file.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Testing::CommandResult;
using testing::ContainsRegex;
using testing::StartsWith;

class KeepFreshKerberosTest : public RealmTest {
 protected:
  /// The example with two lines of input, with `cache` as the process's credential cache.
  CommandResult RunWith(const std::string& cache, const std::string& arguments = "") const {
    return Tarnik::Testing::RunInShell("printf '1\\n2\\n' | KRB5CCNAME=" + cache + " " +
                                       EXAMPLES_FOLDER "/keep_fresh_kerberos " + service_ + " " +
                                       kTarget + arguments + " 2>&1");
  }
  /// A warning about the last leg may precede them.
  static std::string TwoTokensOf(const std::string& user) {
    const std::string line = "a token of " + user + " valid until [0-9]{4}-[0-9T:.-]+Z\n";
    return line + line;
  }

  const Tarnik::Testing::TemporaryFolder folder_;
  const std::string service_ = Sts().HttpsUrl() + " " +
                               folder_.Write("ca.pem", Sts().CaCertificatePem()) + " " +
                               folder_.Write("signing.pem", Sts().SigningCertificatePem());
};

TEST_F(KeepFreshKerberosTest, LogsInOnceWithATicket) {
  const CommandResult run = RunWith(AsAlice().credentialCache);
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.output, ContainsRegex(TwoTokensOf("alice")));
  EXPECT_EQ(Legs().size(), 1U);
}

TEST_F(KeepFreshKerberosTest, LogsInWithAKeytab) {
  const GssapiNegotiationConfig machine = AsMachine();
  const CommandResult run =
      RunWith("FILE:/nonexistent/cache", " " + machine.principal + " " + machine.keytab);
  EXPECT_EQ(run.status, 0);
  EXPECT_THAT(run.output, ContainsRegex(TwoTokensOf("machine")));
}

TEST_F(KeepFreshKerberosTest, FailsWithoutATicket) {
  const CommandResult run = RunWith("FILE:/nonexistent/cache");
  EXPECT_EQ(run.status, 1);
  EXPECT_THAT(run.output, StartsWith("No token: "));
  EXPECT_TRUE(Legs().empty());
}

}  // namespace
}  // namespace SsoClient::Testing
