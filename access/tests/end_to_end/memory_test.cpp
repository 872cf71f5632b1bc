// Passwords do not remain in memory. The STS is in this process, and the source in another.
#include <string>

#include <gmock/gmock.h>

#include "end_to_end/end_to_end_fixture.h"
#include "support/child_process.h"
#include "support/temporary_file.h"

namespace SsoClient::Access::Testing {
namespace {

using testing::AllOf;
using testing::Ge;
using testing::Le;

// No ten letters of it are in any other text.
constexpr char kLongPassword[] = "q7vN2kL9xW4zR8pT3mB6yH1cJ5dF0sG";

class MemoryTest : public testing::TestWithParam<bool> {
 protected:
  MemoryTest() {
    DevSts::Users users = DevSts::DemoUsers();
    users.at(kUser).password = kLongPassword;
    sts_.SetUsers(users);
  }

  static std::string Backwards(const std::string& text) { return {text.rbegin(), text.rend()}; }
  /// In how many places the probe finds `text`.
  int Count(const std::string& where, const std::string& text,
            const std::string& password = kLongPassword) const {
    return Tarnik::Testing::RunToEnd({MEMORY_PROBE, where,
                                      GetParam() ? sts_.HttpsUrl() : sts_.HttpUrl(), ca_.Path(),
                                      signing_.Path(), Backwards(password), Backwards(text)});
  }

  DevSts::Server sts_;
  const Tarnik::Testing::TemporaryFile ca_{sts_.CaCertificatePem()};
  const Tarnik::Testing::TemporaryFile signing_{sts_.SigningCertificatePem()};
};

TEST_P(MemoryTest, TheUserNameIsFound) {
  EXPECT_THAT(Count("freed", kUser), AllOf(Ge(1), Le(100)));
#ifndef __SANITIZE_ADDRESS__
  EXPECT_THAT(Count("memory", kUser), AllOf(Ge(1), Le(100)));
#endif
}

TEST_P(MemoryTest, ReleasedMemoryDoesNotContainThePassword) {
  EXPECT_EQ(Count("freed", kLongPassword), 0);
  const std::string wrong = "another one, which is refused";
  EXPECT_EQ(Count("freed", wrong, wrong), 0);
  EXPECT_EQ(sts_.Requests().size(), 4U);
}

#ifndef __SANITIZE_ADDRESS__
// AddressSanitizer reserves more memory than can be searched.
TEST_P(MemoryTest, MemoryDoesNotContainThePasswordAfterALogin) {
  EXPECT_EQ(Count("memory", kLongPassword), 0);
  EXPECT_EQ(sts_.Requests().size(), 3U);
}
#endif

INSTANTIATE_TEST_SUITE_P(Transports, MemoryTest, testing::Bool(),
                         [](const auto& tested) { return tested.param ? "Https" : "Http"; });

}  // namespace
}  // namespace SsoClient::Access::Testing
