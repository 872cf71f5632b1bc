#include <cstdint>
#include <memory>
#include <string>
#include <type_traits>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/principal_id.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/saml_token_factory.h>
#include <ssoclient/token_spec.h>
#include <tarnik/system/date_time.h>

#include "support/fake_saml_token.h"

// Callers initialise and unpack the records by position as well as by name, so the order of their
// fields is part of the interface.
namespace SsoClient::Testing {
namespace {

using Tarnik::System::DateTime;

template <class Record>
class PlainRecordTest : public testing::Test {};

using AllRecords =
    testing::Types<PrincipalId, AdviceAttribute, Advice, Delegate, SubjectNames, TokenSpec>;
TYPED_TEST_SUITE(PlainRecordTest, AllRecords);

TYPED_TEST(PlainRecordTest, IsAValueWithoutVirtualFunctions) {
  EXPECT_TRUE(std::is_aggregate_v<TypeParam>);
  EXPECT_FALSE(std::is_polymorphic_v<TypeParam>);
  EXPECT_TRUE(std::is_copy_constructible_v<TypeParam>);
  EXPECT_TRUE(std::is_copy_assignable_v<TypeParam>);
}

TEST(RecordsTest, HoldTheirFieldsInOrder) {
  const PrincipalId principal{"name", "domain"};
  EXPECT_EQ(principal.name, "name");
  EXPECT_EQ(principal.domain, "domain");
  const AdviceAttribute attribute{"name", {"b", "a", "b"}};
  EXPECT_EQ(attribute.name, "name");
  EXPECT_EQ(attribute.values, (std::vector<std::string>{"b", "a", "b"}));
  const Advice advice{"source", {attribute, {"second", {}}}};
  EXPECT_EQ(advice.source, "source");
  ASSERT_EQ(advice.attributes.size(), 2U);
  EXPECT_EQ(advice.attributes[0].name, "name");
  EXPECT_EQ(advice.attributes[1].name, "second");
  const Delegate delegate{principal, DateTime::Parse("2024-03-05T07:08:09.000001Z")};
  EXPECT_EQ(delegate.delegate.name, "name");
  EXPECT_EQ(delegate.delegationInstant.ToString(), "2024-03-05T07:08:09.000001Z");
  const SubjectNames names{"given", "last"};
  EXPECT_EQ(names.givenName, "given");
  EXPECT_EQ(names.surname, "last");
}

TEST(TokenSpecTest, HoldsItsFieldsInOrder) {
  const std::shared_ptr<const SamlToken> token = std::make_shared<const FakeSamlToken>("<a/>");
  const TokenSpec spec{1,     {"urn:b", "urn:a", "urn:b"}, {{"source", {}}},
                       true,  std::string("bob"),          token,
                       false, CONFIRMATION_BEARER};
  EXPECT_EQ(spec.tokenLifetimeSec, 1);
  EXPECT_EQ(
      std::vector<std::string>(spec.audienceRestriction.begin(), spec.audienceRestriction.end()),
      (std::vector<std::string>{"urn:a", "urn:b"}));
  ASSERT_EQ(spec.advice.size(), 1U);
  EXPECT_EQ(spec.advice[0].source, "source");
  EXPECT_TRUE(spec.delegable);
  EXPECT_EQ(spec.delegateTo.value_or("none"), "bob");
  ASSERT_TRUE(spec.actAsToken.has_value());
  EXPECT_EQ(spec.actAsToken->get(), token.get());
  EXPECT_FALSE(spec.renewable);
  EXPECT_EQ(spec.confirmation, CONFIRMATION_BEARER);
}

TEST(TokenSpecTest, RequestsNothingByDefault) {
  const TokenSpec spec;
  EXPECT_EQ(spec.tokenLifetimeSec, 0);
  EXPECT_TRUE(spec.audienceRestriction.empty());
  EXPECT_TRUE(spec.advice.empty());
  EXPECT_FALSE(spec.delegable);
  EXPECT_FALSE(spec.delegateTo.has_value());
  EXPECT_FALSE(spec.actAsToken.has_value());
  EXPECT_FALSE(spec.renewable);
  EXPECT_EQ(spec.confirmation, CONFIRMATION_DEFAULT);
}

TEST(TokenSpecTest, HoldsItsLifetimeIn64SignedBits) {
  EXPECT_TRUE((std::is_same_v<decltype(TokenSpec::tokenLifetimeSec), std::int64_t>));
}

TEST(ConfirmationTypesTest, HaveTheirValuesIn32Bits) {
  EXPECT_TRUE((std::is_same_v<std::underlying_type_t<ConfirmationType>, std::int32_t>));
  EXPECT_TRUE((std::is_same_v<std::underlying_type_t<TokenConfirmationType>, std::int32_t>));
  EXPECT_EQ(CONFIRMATION_DEFAULT, 0);
  EXPECT_NE(CONFIRMATION_BEARER, 0);
  EXPECT_EQ(BEARER, 0);
  EXPECT_EQ(HOLDER_OF_KEY, 1);
}

// They are owned by shared pointers, which destroy the implementation.
TEST(InterfacesTest, HaveNoVirtualDestructor) {
  EXPECT_FALSE(std::has_virtual_destructor_v<SamlToken>);
  EXPECT_FALSE(std::has_virtual_destructor_v<SamlTokenFactory>);
}

}  // namespace
}  // namespace SsoClient::Testing
