#include "gss_credentials.h"

#include <ssoclient/exceptions.h>

#include <filesystem>
#include <fstream>

#include "expect_login.h"
#include "gssapi_negotiation_handler_impl.h"
#include "realm_fixture.h"
#include "support/thrown_message.h"

namespace SsoClient {
namespace {

using Testing::ThrownMessage;
using namespace std::chrono_literals;

// Credentials are judged by whom a service sees log in with them.
class GssCredentialsTest : public Testing::RealmFixture {
 protected:
  static void ExpectLogin(const GssapiNegotiationConfig& config, const std::string& client) {
    GssapiNegotiationHandlerImpl handler(config);
    Testing::ExpectLogin(handler, serviceKeytab, client);
  }

  static std::string Complaint(const CredentialSource& source) {
    return ThrownMessage<SsoException>([&] {
      GssCredential credentials;
      AcquireCredentials(source, credentials);
    });
  }

  // "FILE:PATH" without its kind.
  static std::string PathOf(const std::string& cache) { return cache.substr(5); }

  static constexpr char kNone[] =
      "There are no credentials to log in with: No credentials were supplied, or the credentials "
      "were unavailable or inaccessible ";
};

TEST_F(GssCredentialsTest, ComeFromTheDefaultCache) {
  auto config = ConfigOf("alice");
  SetDefaultCache(config.credentialCache);
  config.credentialCache.clear();
  ExpectLogin(config, "alice@EXAMPLE.COM");
}

TEST_F(GssCredentialsTest, ComeFromANamedCache) {
  SetDefaultCache(realm->Login("alice", "secret"));
  ExpectLogin(ConfigOf("bob"), "bob@EXAMPLE.COM");
}

TEST_F(GssCredentialsTest, ComeFromAKeytab) {
  ExpectLogin(MachineConfig(), "machine@EXAMPLE.COM");
}

TEST_F(GssCredentialsTest, ComeFromTheFirstKeyOfAKeytab) {
  auto config = MachineConfig();
  config.principal.clear();
  ExpectLogin(config, "machine@EXAMPLE.COM");
}

TEST_F(GssCredentialsTest, LeaveTheDefaultCacheAsItIsWhenThereIsAKeytab) {
  const std::string cache = realm->Login("alice", "secret");
  SetDefaultCache(cache);
  const auto size = std::filesystem::file_size(PathOf(cache));
  ExpectLogin(MachineConfig(), "machine@EXAMPLE.COM");
  EXPECT_EQ(std::filesystem::file_size(PathOf(cache)), size);
  auto config = ConfigOf("alice");
  config.credentialCache.clear();
  ExpectLogin(config, "alice@EXAMPLE.COM");
}

TEST_F(GssCredentialsTest, PutTheTicketsOfAKeytabIntoANamedCache) {
  auto config = MachineConfig();
  config.credentialCache = "FILE:" + realm->Folder() + "/machine-cache";
  ExpectLogin(config, "machine@EXAMPLE.COM");
  config.keytab.clear();
  ExpectLogin(config, "machine@EXAMPLE.COM");
}

TEST_F(GssCredentialsTest, AreThoseOfThePrincipalAmongTheCaches) {
  const std::string folder = realm->Folder() + "/caches";
  std::filesystem::create_directory(folder);
  std::filesystem::copy_file(PathOf(realm->Login("alice", "secret")), folder + "/tktalice");
  std::filesystem::copy_file(PathOf(realm->Login("bob", "secret")), folder + "/tktbob");
  std::ofstream(folder + "/primary") << "tktalice\n";
  SetDefaultCache("DIR:" + folder);

  GssapiNegotiationConfig config;
  config.targetService = kService;
  ExpectLogin(config, "alice@EXAMPLE.COM");
  config.principal = "bob";
  ExpectLogin(config, "bob@EXAMPLE.COM");
  config.principal = "alice@EXAMPLE.COM";
  ExpectLogin(config, "alice@EXAMPLE.COM");
}

TEST_F(GssCredentialsTest, AreNotThoseOfAnotherPrincipal) {
  const std::string cache = realm->Login("alice", "secret");
  EXPECT_EQ(Complaint({"bob", "", cache}),
            std::string(kNone) + "(Principal in credential cache does not match desired name).");
  SetDefaultCache(cache);
  EXPECT_EQ(
      Complaint({"bob", "", ""}),
      std::string(kNone) + "(Can't find client principal bob@EXAMPLE.COM in cache collection).");
}

TEST_F(GssCredentialsTest, TellWhyThereAreNone) {
  EXPECT_EQ(Complaint({"", "", ""}),
            std::string(kNone) +
                "(No Kerberos credentials available (default cache: FILE:/nonexistent/cache)).");
  EXPECT_EQ(Complaint({"", "", "FILE:/nonexistent/other"}),
            std::string(kNone) + "(No credentials cache found).");
  EXPECT_EQ(Complaint({"", "", "NONSENSE:cache"}),
            std::string(kNone) + "(Unknown credential cache type).");
  EXPECT_EQ(Complaint({"machine", "/nonexistent/keytab", ""}),
            "The keytab `/nonexistent/keytab' cannot be used: Key table file "
            "'/nonexistent/keytab' not found.");
}

TEST_F(GssCredentialsTest, TellThatANameIsNone) {
  EXPECT_EQ(Complaint({"a@b@c", "", realm->Login("alice", "secret")}),
            "There are no credentials to log in with: An invalid name was supplied (Malformed "
            "representation of principal).");
}

TEST_F(GssCredentialsTest, TellThatTheRealmKnowsNoKeyOfTheKeytab) {
  DevSts::KerberosRealm other;
  const std::string keytab = other.AddKeytab("stranger");
  EXPECT_EQ(Complaint({"stranger", keytab, "MEMORY:stranger"}),
            std::string(kNone) + "(Client 'stranger@EXAMPLE.COM' not found in Kerberos database).");
  EXPECT_EQ(Complaint({"machine", other.AddKeytab("machine"), "MEMORY:machine"}),
            std::string(kNone) + "(Decrypt integrity check failed).");
}

}  // namespace
}  // namespace SsoClient
