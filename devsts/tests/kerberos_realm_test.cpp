#include "devsts/kerberos_realm.h"

#include <array>
#include <cerrno>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <optional>
#include <stdexcept>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <signal.h>

#include "program_process.h"

namespace DevSts::Testing {
namespace {

using testing::HasSubstr;
using namespace std::chrono_literals;

struct Outcome {
  std::string output;
  int status = -1;
};

// An environment variable that has another value until the destructor restores it.
class ReplacedVariable {
 public:
  ReplacedVariable(const char* name, const std::string& value) : name_(name) {
    if (const char* before = std::getenv(name)) {
      before_ = before;
    }
    ::setenv(name, value.c_str(), 1);
  }
  ~ReplacedVariable() {
    if (before_) {
      ::setenv(name_, before_->c_str(), 1);
    } else {
      ::unsetenv(name_);
    }
  }
  ReplacedVariable(const ReplacedVariable&) = delete;
  ReplacedVariable& operator=(const ReplacedVariable&) = delete;

 private:
  const char* const name_;
  std::optional<std::string> before_;
};

Outcome RunInRealm(const KerberosRealm& realm, const std::string& command) {
  const std::string line = "KRB5_CONFIG=" + realm.ConfigPath() + " " + command + " 2>&1";
  std::FILE* pipe = ::popen(line.c_str(), "r");
  Outcome outcome;
  std::array<char, 256> block;
  while (std::fgets(block.data(), block.size(), pipe) != nullptr) {
    outcome.output += block.data();
  }
  outcome.status = ::pclose(pipe);
  return outcome;
}

TEST(KerberosRealmTest, IssuesTicketsForUsersAndServices) {
  KerberosRealm realm;
  realm.AddUser("alice", "secret");
  const std::string keytab = realm.AddKeytab("HTTP/sts.example");
  const std::string cache = realm.Login("alice", "secret");
  const Outcome ticket =
      RunInRealm(realm, "kvno -k " + keytab + " -c " + cache + " HTTP/sts.example");
  EXPECT_EQ(ticket.status, 0) << ticket.output;
  EXPECT_THAT(ticket.output, HasSubstr("keytab entry valid"));
}

TEST(KerberosRealmTest, RefusesAWrongPassword) {
  KerberosRealm realm;
  realm.AddUser("alice", "secret");
  try {
    realm.Login("alice", "guess");
    FAIL() << "The login succeeded";
  } catch (const std::runtime_error& error) {
    EXPECT_THAT(error.what(), HasSubstr("Password incorrect"));
  }
}

TEST(KerberosRealmTest, IssuesExpiredTicketsWithASlowClock) {
  KerberosRealm realm;
  realm.AddUser("alice", "secret");
  realm.SetClock(-1h);
  const std::string cache = realm.Login("alice", "secret", 10min);
  EXPECT_EQ(RunInRealm(realm, "klist -s -c " + cache).status, 1 << 8);
  realm.SetClock(0s);
  EXPECT_EQ(RunInRealm(realm, "klist -s -c " + realm.Login("alice", "secret")).status, 0);
}

TEST(KerberosRealmTest, DoesNotAnswerWithoutItsKdc) {
  KerberosRealm realm;
  realm.AddUser("alice", "secret");
  realm.StopKdc();
  EXPECT_THROW(realm.Login("alice", "secret"), std::runtime_error);
}

TEST(KerberosRealmTest, StopsItsKdcAndRemovesItsFolder) {
  std::string folder;
  pid_t kdc = 0;
  {
    const KerberosRealm realm;
    folder = realm.Folder();
    kdc = realm.KdcProcess();
    ASSERT_EQ(::kill(kdc, 0), 0);
  }
  EXPECT_FALSE(std::filesystem::exists(folder));
  EXPECT_EQ(::kill(kdc, 0), -1);
  EXPECT_EQ(errno, ESRCH);
}

TEST(KerberosRealmTest, RefusesNamesThatItsToolsWouldMisread) {
  KerberosRealm realm;
  for (const std::string name : {"", "a b", "a\"b", "-randkey", "a\nb"}) {
    EXPECT_THROW(realm.AddUser(name, "secret"), std::runtime_error) << name;
    EXPECT_THROW(realm.AddKeytab(name), std::runtime_error) << name;
  }
}

TEST(KerberosRealmTest, NamesAProgramThatIsNotInstalled) {
  const ReplacedVariable path("PATH", "/nonexistent");
  const ProgramResult result = RunProgram({"--realm"});
  EXPECT_EQ(result.status, 1);
  EXPECT_THAT(result.errors,
              HasSubstr("'kinit' is not installed; a realm needs the packages krb5-kdc, "
                        "krb5-admin-server and krb5-user\n"));
}

TEST(KerberosRealmTest, MayBeInAFolderWithABlank) {
  const ScratchFolder scratch;
  const std::string folder = scratch / "it's \"a\" blank";
  ASSERT_TRUE(std::filesystem::create_directory(folder));
  const ReplacedVariable temporary("TMPDIR", folder);
  ProgramProcess program(
      {"--realm", "--ready-file", scratch / "ready", "--user-keytabs", scratch / "keytabs"});
  program.AwaitReady();
  EXPECT_TRUE(FileExists(scratch / "keytabs/alice.keytab"));
  // A shell reads the lines and finds the ticket of the first user.
  const std::string lines = ". " + (scratch / "ready") + " && export KRB5_CONFIG=\"$krb5_config\" ";
  EXPECT_EQ(std::system((lines + "&& klist -s -c \"$krb5_cache\"").c_str()), 0);
  EXPECT_EQ(std::system((lines + "&& test \"$service\" = HTTP@localhost").c_str()), 0);
}

}  // namespace
}  // namespace DevSts::Testing
