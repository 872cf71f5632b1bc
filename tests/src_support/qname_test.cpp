#include "support/qname.h"

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/parse_xml.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

TEST(ResolveQNameTest, FindsThePrefixInScope) {
  const auto document = ParseXml(R"(<r xmlns:a="urn:outer"><b/></r>)");
  const auto* element = FindElement(document->RootElement(), "b");
  EXPECT_EQ(ResolveQName(*element, "a:name", "urn:default"), (QName{"urn:outer", "name"}));
  EXPECT_EQ(ResolveQName(*element, "xml:lang", ""),
            (QName{"http://www.w3.org/XML/1998/namespace", "lang"}));
}

TEST(ResolveQNameTest, PrefersTheInnerBinding) {
  const auto document = ParseXml(R"(<r xmlns:a="urn:outer"><b xmlns:a="urn:inner"/></r>)");
  EXPECT_EQ(ResolveQName(*FindElement(document->RootElement(), "b"), "a:name", ""),
            (QName{"urn:inner", "name"}));
}

TEST(ResolveQNameTest, UsesTheDefaultForNamesWithoutPrefix) {
  const auto document = ParseXml(R"(<r xmlns="urn:scope"/>)");
  EXPECT_EQ(ResolveQName(*document->RootElement(), "b", "urn:default"),
            (QName{"urn:default", "b"}));
  EXPECT_EQ(ResolveQName(*document->RootElement(), "b", ""), (QName{"", "b"}));
  EXPECT_EQ(ResolveQName(*document->RootElement(), "", ""), (QName{"", ""}));
}

TEST(ResolveQNameTest, SplitsAtTheFirstColon) {
  const auto document = ParseXml(R"(<r xmlns:a="urn:a"/>)");
  EXPECT_EQ(ResolveQName(*document->RootElement(), "a:b:c", ""), (QName{"urn:a", "b:c"}));
  EXPECT_EQ(ResolveQName(*document->RootElement(), "a:", ""), (QName{"urn:a", ""}));
}

TEST(ResolveQNameTest, LooksUpTheEmptyPrefix) {
  const auto bound = ParseXml(R"(<r xmlns="urn:scope"/>)");
  EXPECT_EQ(ResolveQName(*bound->RootElement(), ":b", "urn:default"), (QName{"urn:scope", "b"}));
  const auto unbound = ParseXml("<r/>");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ResolveQName(*unbound->RootElement(), ":b", ""); }),
            "Element rat 1,1 uses undefined prefix: `'");
}

TEST(ResolveQNameTest, RejectsAnUndefinedPrefixAndNamesItsPlace) {
  const auto document = ParseXml("<r xmlns:p=\"urn:p\">\n  <p:b/></r>");
  const auto* element = FindElement(document->RootElement(), "b");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ResolveQName(*element, "a:b", "urn:default"); }),
            "Element p:bat 2,3 uses undefined prefix: `a'");
}

TEST(ResolveQNameTest, IgnoresWhiteSpaceAroundTheName) {
  const auto document = ParseXml(R"(<p:r xmlns:p="urn:p"/>)");
  const auto& root = *document->RootElement();
  for (const char* name : {" p:n", "p:n ", "\n\tp:n\r\n"}) {
    EXPECT_EQ(ResolveQName(root, name, ""), (QName{"urn:p", "n"})) << name;
    EXPECT_EQ(ResolveQNameValue(root, name), (QNameView{"urn:p", "n"})) << name;
  }
  EXPECT_EQ(ResolveQName(root, " \n", "urn:default"), (QName{"urn:default", ""}));
  EXPECT_EQ(ResolveQName(root, " n ", "urn:default"), (QName{"urn:default", "n"}));
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ResolveQName(root, " a:b", ""); }),
            "Element p:rat 1,1 uses undefined prefix: `a'");
}

// Only white space around it can be part of the value of a QName.
TEST(ResolveQNameTest, KeepsWhiteSpaceWithinTheName) {
  const auto document = ParseXml(R"(<p:r xmlns:p="urn:p"/>)");
  const auto& root = *document->RootElement();
  EXPECT_EQ(ResolveQName(root, "p: n", ""), (QName{"urn:p", " n"}));
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ResolveQName(root, "p :n", ""); }),
            "Element p:rat 1,1 uses undefined prefix: `p '");
}

TEST(ResolveQNameValueTest, UsesTheDefaultNamespaceInScope) {
  const auto document = ParseXml(R"(<r xmlns="urn:scope"><b xmlns=""/></r>)");
  EXPECT_EQ(ResolveQNameValue(*document->RootElement(), "t"), (QNameView{"urn:scope", "t"}));
  EXPECT_EQ(ResolveQNameValue(*FindElement(document->RootElement(), "b"), "t"),
            (QNameView{"", "t"}));
}

}  // namespace
}  // namespace SsoClient::Testing
