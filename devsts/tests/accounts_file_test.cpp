#include "accounts_file.h"

#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "devsts/certificates.h"
#include "errors.h"
#include "help_texts.h"
#include "program_process.h"

namespace DevSts::Testing {
namespace {

using Program::AccountsFile;
using Program::ReadAccounts;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Pair;
using testing::SizeIs;
using testing::StartsWith;

AccountsFile Read(const ScratchFolder& folder, const std::string& text) {
  WriteTextTo(folder / "accounts", text);
  return ReadAccounts(folder / "accounts");
}

TEST(AccountsFileTest, ReadsEveryProperty) {
  const ScratchFolder folder;
  CertificateSpec spec;
  spec.commonName = "alice";
  const Credential alice = MakeCertificate(spec);
  WriteTextTo(folder / "alice.pem", alice.certificatePem);
  const AccountsFile accounts = Read(folder,
                                     "# comment\r\n"
                                     "[service]\n"
                                     "realm = yes\n"
                                     "principal = HTTP/sts.example\n"
                                     "user-keytabs = keytabs\n"
                                     "\n"
                                     "[user alice@EXAMPLE.COM]\n"
                                     "password = a = b\n"
                                     "group = EXAMPLE\\staff\n"
                                     "group=EXAMPLE\\admins\n"
                                     "given-name = Alice\n"
                                     "surname = Archer\n"
                                     "certificate = alice.pem\n"
                                     "principal = alice/web@EXAMPLE.COM\n"
                                     "[user machine@OTHER.COM]\n"
                                     "; comment\n"
                                     "solution = yes\n"
                                     "password-expired = yes\n"
                                     "client-certificate = yes\n");
  EXPECT_TRUE(accounts.startsRealm);
  EXPECT_EQ(accounts.servicePrincipal, "HTTP/sts.example");
  EXPECT_EQ(accounts.userKeytabs, folder / "keytabs");
  EXPECT_THAT(accounts.order, ElementsAre("alice@EXAMPLE.COM", "machine@OTHER.COM"));
  EXPECT_THAT(accounts.principals, ElementsAre(Pair("alice/web@EXAMPLE.COM", "alice@EXAMPLE.COM")));
  EXPECT_EQ(accounts.clientUser, "machine@OTHER.COM");
  const User& user = accounts.users.at("alice@EXAMPLE.COM");
  EXPECT_EQ(user.password, "a = b");
  EXPECT_THAT(user.groups, ElementsAre("EXAMPLE\\staff", "EXAMPLE\\admins"));
  EXPECT_EQ(user.givenName + " " + user.surname, "Alice Archer");
  EXPECT_THAT(user.certificates, ElementsAre(alice.certificatePem));
  EXPECT_FALSE(user.isSolution || user.passwordExpired);
  const User& machine = accounts.users.at("machine@OTHER.COM");
  EXPECT_TRUE(machine.isSolution && machine.passwordExpired);
}

TEST(AccountsFileTest, ReadsTheFileThatTheHelpShows) {
  const ScratchFolder folder;
  const AccountsFile accounts = Read(folder, Program::AccountsHelp());
  EXPECT_THAT(accounts.users, SizeIs(3));
  EXPECT_TRUE(accounts.startsRealm);
}

struct WrongLine {
  const char* name;
  const char* text;
  unsigned line;
  const char* message;
};

class WrongAccountsTest : public testing::TestWithParam<WrongLine> {};

TEST_P(WrongAccountsTest, AreRefusedWithTheLine) {
  const ScratchFolder folder;
  try {
    Read(folder, GetParam().text);
    FAIL() << "The file was accepted";
  } catch (const Program::UsageError& error) {
    EXPECT_THAT(error.what(),
                StartsWith((folder / "accounts") + ":" + std::to_string(GetParam().line) + ": "));
    EXPECT_THAT(error.what(), HasSubstr(GetParam().message));
  }
}

INSTANTIATE_TEST_SUITE_P(
    Each, WrongAccountsTest,
    testing::Values(
        WrongLine{"Empty", "", 1, "no section [user"},
        WrongLine{"ServiceOnly", "[service]\nrealm = yes\n", 2, "no section [user"},
        WrongLine{"KeyBeforeSection", "password = x\n", 1, "no section before"},
        WrongLine{"UnknownSection", "[users]\n", 1, "a section is"},
        WrongLine{"UnclosedSection", "[user a@B\n", 1, "a section is"},
        WrongLine{"NameWithoutDomain", "[user alice]\n", 1, "NAME@DOMAIN"},
        WrongLine{"NameWithTwoDomains", "[user a@B@C]\n", 1, "NAME@DOMAIN"},
        WrongLine{"UnknownKey", "[user a@B]\npasword = x\n", 2, "no key 'pasword'"},
        WrongLine{"KeyOfAnotherSection", "[service]\npassword = x\n", 2, "no key 'password'"},
        WrongLine{"NoValue", "[user a@B]\npassword =\n", 2, "has no value"},
        WrongLine{"NoSign", "[user a@B]\npassword\n", 2, "KEY = VALUE"},
        WrongLine{"TwoPasswords", "[user a@B]\npassword = x\npassword = y\n", 3, "given twice"},
        WrongLine{"TheSameGroup", "[user a@B]\ngroup = B\\g\ngroup = B\\g\n", 3, "given twice"},
        WrongLine{"GroupWithoutDomain", "[user a@B]\ngroup = staff\n", 2, "DOMAIN\\group"},
        WrongLine{"WrongFlag", "[user a@B]\nsolution = true\n", 2, "not one of yes, no"},
        WrongLine{"TwoUsers", "[user a@B]\n[user a@B]\n", 2, "second user"},
        WrongLine{"TwoServices", "[service]\n[service]\n", 2, "second section"},
        WrongLine{"TwoOwners",
                  "[user a@B]\nclient-certificate = yes\n[user b@B]\nclient-certificate = yes\n", 4,
                  "already belongs to a@B"},
        WrongLine{"SharedPrincipal", "[user a@B]\nprincipal = p@R\n[user b@B]\nprincipal = p@R\n",
                  4, "already belongs"},
        WrongLine{"MissingCertificate", "[user a@B]\ncertificate = none.pem\n", 2,
                  "cannot be used"},
        WrongLine{"ServicePrincipal", "[service]\nprincipal = HTTP\n", 2, "HTTP/HOST"},
        WrongLine{"RealmAndKeytab", "[service]\nrealm = yes\nkeytab = k\n[user a@B]\n", 4,
                  "exclude each other"},
        WrongLine{"ControlCharacter", "[user a@B]\npassword = \x01\n", 2, "control character"},
        WrongLine{"Latin1", "[user a@B]\ngiven-name = Zo\xeb\n", 2, "not UTF-8"},
        WrongLine{"Latin1Name", "[user Zo\xeb@B]\n", 1, "not UTF-8"}),
    [](const auto& test) { return std::string(test.param.name); });

TEST(AccountsFileTest, MayBeginWithAByteOrderMark) {
  const ScratchFolder folder;
  const AccountsFile accounts =
      Read(folder, "\xef\xbb\xbf[user a@B]\r\ngiven-name = Zo\xc3\xab\r\n");
  EXPECT_EQ(accounts.users.at("a@B").givenName, "Zo\xc3\xab");
}

TEST(AccountsFileTest, RefusesPasswordsThatARealmWouldMisread) {
  const ScratchFolder folder;
  const AccountsFile accounts = Read(
      folder, "[user a@OTHER.COM]\npassword = two words\n[user b@EXAMPLE.COM]\npassword = x y\n");
  try {
    Program::RequireRealmUsers(accounts, "FILE");
    FAIL() << "The password was accepted";
  } catch (const Program::UsageError& error) {
    EXPECT_THAT(error.what(), StartsWith("FILE:4: "));
  }
}

TEST(AccountsFileTest, ReportsAFileThatCannotBeRead) {
  EXPECT_THROW(ReadAccounts("/nonexistent/accounts"), Program::FileError);
}

}  // namespace
}  // namespace DevSts::Testing
