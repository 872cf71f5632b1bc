#include "gate/confirmation_end.h"

#include "gate/gate_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using std::chrono::seconds;

class ConfirmationEndTest : public GateFixture {
 protected:
  Tarnik::System::DateTime EndOf(AssertionText token, seconds end) const {
    token.subject = Replaced(token.subject, After(start, seconds(3600)).ToString(),
                             After(start, end).ToString());
    return ConfirmationEndOf(*CreateSamlToken(Signed(token)));
  }
};

TEST_F(ConfirmationEndTest, BearerToken) {
  EXPECT_EQ(EndOf(text, seconds(7200)), After(start, seconds(7200)));
}

TEST_F(ConfirmationEndTest, HolderOfKeyToken) {
  EXPECT_EQ(EndOf(HolderOfKeyText(), seconds(600)), After(start, seconds(600)));
}

// The delegate's NameID comes before the data.
TEST_F(ConfirmationEndTest, DelegatedToken) {
  AssertionText delegated = HolderOfKeyText();
  delegated.subject = Replaced(delegated.subject, "cm:holder-of-key", "cm:bearer");
  delegated.Delegate();
  delegated.subject = Replaced(delegated.subject, "cm:bearer", "cm:holder-of-key");
  EXPECT_EQ(EndOf(delegated, seconds(600)), After(start, seconds(600)));
}

}  // namespace
}  // namespace SsoClient::Access::Testing
