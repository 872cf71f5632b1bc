#include "credentials.h"

#include <chrono>
#include <filesystem>
#include <fstream>
#include <string>

#include <gtest/gtest.h>
#include <krb5.h>

#include <ssoclient/exceptions.h>

#include "gss_acceptor.h"
#include "gssapi_negotiation_handler_impl.h"
#include "handles.h"
#include "realm_fixture.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

using Testing::ThrownMessage;
using namespace std::chrono_literals;

// Tests credentials by the client that a service sees log in with them.
class GssCredentialsTest : public RealmFixture {
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

  // The path in "FILE:PATH".
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

TEST_F(GssCredentialsTest, SayWhyThereAreNone) {
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

TEST_F(GssCredentialsTest, SayThatANameIsInvalid) {
  EXPECT_EQ(Complaint({"a@b@c", "", realm->Login("alice", "secret")}),
            "There are no credentials to log in with: An invalid name was supplied (Malformed "
            "representation of principal).");
}

TEST_F(GssCredentialsTest, SayThatTheRealmDoesNotKnowTheKeyOfAKeytab) {
  DevSts::KerberosRealm other;
  const std::string keytab = other.AddKeytab("stranger");
  EXPECT_EQ(Complaint({"stranger", keytab, "MEMORY:stranger"}),
            std::string(kNone) + "(Client 'stranger@EXAMPLE.COM' not found in Kerberos database).");
  EXPECT_EQ(Complaint({"machine", other.AddKeytab("machine"), "MEMORY:machine"}),
            std::string(kNone) + "(Decrypt integrity check failed).");
}

class KeytabCheckTest : public RealmFixture {
 protected:
  static std::string Complaint(const std::string& keytab, const std::string& principal) {
    return ThrownMessage<SsoException>([&] { CheckKeytab(keytab, principal); });
  }
};

TEST_F(KeytabCheckTest, AcceptsAKeytabWithAFittingKey) {
  EXPECT_NO_THROW(CheckKeytab(machineKeytab, ""));
  EXPECT_NO_THROW(CheckKeytab(machineKeytab, "machine"));
  EXPECT_NO_THROW(CheckKeytab("FILE:" + machineKeytab, "machine@EXAMPLE.COM"));
}

TEST_F(KeytabCheckTest, ReportsAMissingKeytab) {
  EXPECT_EQ(Complaint("/nonexistent/keytab", "machine"),
            "The keytab `/nonexistent/keytab' cannot be used: Key table file "
            "'/nonexistent/keytab' not found.");
  EXPECT_EQ(Complaint("/nonexistent/keytab", ""),
            "The keytab `/nonexistent/keytab' cannot be used: Keytab FILE:/nonexistent/keytab is "
            "nonexistent or empty.");
}

TEST_F(KeytabCheckTest, ReportsAPrincipalWithoutAKey) {
  EXPECT_EQ(Complaint(machineKeytab, "bob"), "The keytab `" + machineKeytab +
                                                 "' cannot be used: No key table entry found for "
                                                 "bob@EXAMPLE.COM.");
}

TEST_F(KeytabCheckTest, ReportsAFileThatIsNotAKeytab) {
  EXPECT_EQ(Complaint(realm->ConfigPath(), "machine"),
            "The keytab `" + realm->ConfigPath() +
                "' cannot be used: Unsupported key table format version number.");
}

TEST_F(KeytabCheckTest, ReportsInvalidNames) {
  EXPECT_EQ(
      Complaint(machineKeytab, "a@b@c"),
      "The keytab `" + machineKeytab + "' cannot be used: Malformed representation of principal.");
  EXPECT_EQ(Complaint("NONSENSE:keytab", ""),
            "The keytab `NONSENSE:keytab' cannot be used: Unknown Key table type.");
}

krb5_ccache Resolve(const Krb5Context& context, const std::string& name) {
  krb5_ccache cache = nullptr;
  EXPECT_EQ(krb5_cc_resolve(context.get(), name.c_str(), &cache), 0);
  return cache;
}

bool HasOwner(const Krb5Context& context, const std::string& name) {
  krb5_ccache cache = Resolve(context, name);
  krb5_principal owner = nullptr;
  const bool hasOwner = krb5_cc_get_principal(context.get(), cache, &owner) == 0;
  krb5_free_principal(context.get(), owner);
  krb5_cc_close(context.get(), cache);
  return hasOwner;
}

TEST(MemoryCacheTest, DestroysItsTickets) {
  const auto context = CreateKrb5Context();
  ASSERT_NE(context, nullptr);
  std::string name;
  {
    const MemoryCache cache;
    name = cache.Name();
    krb5_principal owner = nullptr;
    ASSERT_EQ(krb5_parse_name(context.get(), "alice@EXAMPLE.COM", &owner), 0);
    krb5_ccache opened = Resolve(context, name);
    EXPECT_EQ(krb5_cc_initialize(context.get(), opened, owner), 0);
    krb5_cc_close(context.get(), opened);
    krb5_free_principal(context.get(), owner);
    EXPECT_TRUE(HasOwner(context, name));
  }
  EXPECT_FALSE(HasOwner(context, name));
}

TEST(MemoryCacheTest, HasAUniqueName) {
  const MemoryCache one;
  const MemoryCache other;
  EXPECT_EQ(one.Name().rfind("MEMORY:", 0), 0U);
  EXPECT_NE(one.Name(), other.Name());
}

}  // namespace
}  // namespace SsoClient::Testing
