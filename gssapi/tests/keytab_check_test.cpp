#include "keytab_check.h"

#include <ssoclient/exceptions.h>

#include "realm_fixture.h"
#include "support/thrown_message.h"

namespace SsoClient {
namespace {

using Testing::ThrownMessage;

class KeytabCheckTest : public Testing::RealmFixture {
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

TEST_F(KeytabCheckTest, TellsThatThereIsNone) {
  EXPECT_EQ(Complaint("/nonexistent/keytab", "machine"),
            "The keytab `/nonexistent/keytab' cannot be used: Key table file "
            "'/nonexistent/keytab' not found.");
  EXPECT_EQ(Complaint("/nonexistent/keytab", ""),
            "The keytab `/nonexistent/keytab' cannot be used: Keytab FILE:/nonexistent/keytab is "
            "nonexistent or empty.");
}

TEST_F(KeytabCheckTest, TellsThatThePrincipalHasNoKeyInIt) {
  EXPECT_EQ(Complaint(machineKeytab, "bob"), "The keytab `" + machineKeytab +
                                                 "' cannot be used: No key table entry found for "
                                                 "bob@EXAMPLE.COM.");
}

TEST_F(KeytabCheckTest, TellsThatAFileIsNoKeytab) {
  EXPECT_EQ(Complaint(realm->ConfigPath(), "machine"),
            "The keytab `" + realm->ConfigPath() +
                "' cannot be used: Unsupported key table format version number.");
}

TEST_F(KeytabCheckTest, TellsThatANameIsNone) {
  EXPECT_EQ(
      Complaint(machineKeytab, "a@b@c"),
      "The keytab `" + machineKeytab + "' cannot be used: Malformed representation of principal.");
  EXPECT_EQ(Complaint("NONSENSE:keytab", ""),
            "The keytab `NONSENSE:keytab' cannot be used: Unknown Key table type.");
}

}  // namespace
}  // namespace SsoClient
