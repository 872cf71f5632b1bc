#include "xml/request_bodies.h"

#include <gmock/gmock.h>

#include "xml/built_xml.h"

namespace SsoClient {
namespace {

using testing::HasSubstr;
using testing::Not;

TokenSpec Spec() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 60;
  return spec;
}

std::string ContextOf(const Tarnik::Xml::ElementNode& element) {
  return std::string(element.FindAttribute("Context").value_or("none"));
}

TEST(XMLBodyBuilderInitialSPNegoTest, IsAnIssueBodyWithTheLegBehindAndAContext) {
  for (const unsigned keyType : {0U, 1U}) {
    const auto element = Testing::Built(XMLBodyBuilderInitialSPNego(keyType, Spec(), {1, 2, 3}));
    const auto expected = BuildIssueBodyWithUseKey(keyType, Spec());
    expected->Add(BuildBinaryExchange({1, 2, 3}));
    const auto attribute = " Context=\"" + ContextOf(*element) + "\"";
    auto xml = Testing::XmlText(element.get());
    // Behind the declarations.
    const std::size_t position = xml.find(attribute + ">");
    ASSERT_NE(position, std::string::npos);
    xml.erase(position, attribute.size());
    EXPECT_EQ(Testing::WithoutTimes(xml), Testing::WithoutTimes(Testing::BuiltXml(*expected)));
  }
}

TEST(XMLBodyBuilderInitialSPNegoTest, TheUseKeyStandsBeforeTheLeg) {
  const auto xml = Testing::BuiltXml(XMLBodyBuilderInitialSPNego(1, Spec(), {1}));
  EXPECT_LT(xml.find("<wst:UseKey"), xml.find("<wst:BinaryExchange"));
  EXPECT_THAT(Testing::BuiltXml(XMLBodyBuilderInitialSPNego(0, Spec(), {1})),
              Not(HasSubstr("UseKey")));
}

TEST(XMLBodyBuilderInitialSPNegoTest, KeepsACopyOfTheSpecAndTheLeg) {
  auto spec = Spec();
  std::vector<unsigned char> leg{1};
  const XMLBodyBuilderInitialSPNego builder(0, spec, leg);
  spec.renewable = true;
  leg.clear();
  const auto xml = Testing::BuiltXml(builder);
  EXPECT_THAT(xml, HasSubstr("<wst:Renewing Allow=\"false\" OK=\"false\"/>"));
  EXPECT_THAT(xml, HasSubstr(">AQ==</wst:BinaryExchange></wst:RequestSecurityToken>"));
}

TEST(XMLBodyBuilderInitialSPNegoTest, AnEmptyLegIsSentEmpty) {
  EXPECT_THAT(Testing::BuiltXml(XMLBodyBuilderInitialSPNego(0, Spec(), {})),
              HasSubstr(Testing::BuiltXml(*BuildBinaryExchange({}))));
}

TEST(XMLBodyBuilderInitialSPNegoTest, EachBuildDrawsANewContext) {
  const XMLBodyBuilderInitialSPNego builder(0, Spec(), {1});
  const auto first = ContextOf(*Testing::Built(builder));
  EXPECT_THAT(first, testing::MatchesRegex("urn:uuid:[0-9a-f-]{36}"));
  EXPECT_NE(first, ContextOf(*Testing::Built(builder)));
}

}  // namespace
}  // namespace SsoClient
