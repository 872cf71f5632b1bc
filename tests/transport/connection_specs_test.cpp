#include "transport/sso_connection_specs.h"

#include <gmock/gmock.h>

#include "transport/fake_ssl.h"

namespace SsoClient {
namespace {

using Tarnik::Http::ConnectionSpec;
using Tarnik::Http::CustomConnectionSpec;

TEST(ConnectionSpecsTest, MakeAPlainSpecAndReleaseWhatWasHeld) {
  Tarnik::Ref<ConnectionSpec> spec;
  CreateSsoConnectionSpec("old", 1, false, spec);
  const auto old = spec;
  EXPECT_EQ(old->RefCount(), 2);
  CreateSsoConnectionSpec("sts.example", 443, true, spec);
  EXPECT_EQ(old->RefCount(), 1);
  const auto* custom = dynamic_cast<const CustomConnectionSpec*>(spec.get());
  ASSERT_NE(custom, nullptr);
  EXPECT_EQ(custom->EndpointKey(), "sts.example:443");
}

TEST(ConnectionSpecsTest, MakeATlsSpecAroundAPlainOneAndReleaseWhatWasHeld) {
  const auto context = Tarnik::MakeRef<Testing::FakeSslContext>();
  Tarnik::Ref<ConnectionSpec> spec;
  CreateSsoConnectionSpec("old", 1, false, spec);
  const auto old = spec;
  CreateSsoSSLConnectionSpec("sts.example", 8443, context.get(), "peer", false, spec);
  EXPECT_EQ(old->RefCount(), 1);
  EXPECT_EQ(context->RefCount(), 2);
  const auto* custom = dynamic_cast<const CustomConnectionSpec*>(spec.get());
  ASSERT_NE(custom, nullptr);
  EXPECT_EQ(custom->EndpointKey(), "sts.example:8443");
  EXPECT_THAT(custom->ToString(), testing::EndsWith(", SsoCustomConnectionSpec:sts.example:8443>"));
}

TEST(ConnectionSpecsTest, JudgeNoneOfTheirArguments) {
  Tarnik::Ref<ConnectionSpec> spec;
  CreateSsoConnectionSpec("", -1, false, spec);
  EXPECT_EQ(dynamic_cast<const CustomConnectionSpec&>(*spec).EndpointKey(), ":-1");
  CreateSsoSSLConnectionSpec("a b", 70'000, nullptr, "", true, spec);
  EXPECT_EQ(dynamic_cast<const CustomConnectionSpec&>(*spec).EndpointKey(), "a b:70000");
}

}  // namespace
}  // namespace SsoClient
