#include <algorithm>
#include <cstddef>
#include <ctime>
#include <functional>
#include <ostream>
#include <string>

#include <gtest/gtest.h>

#include <ssoclient/saml_token.h>
#include <tarnik/core/ref.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "support/assertion_text.h"
#include "support/parse_xml.h"

// The time to read a token is linear in its size, whatever it contains.
namespace SsoClient::Testing {
namespace {

std::string Repeated(const std::string& text, std::size_t count) {
  std::string result;
  for (std::size_t i = 0; i < count; ++i) {
    result += text;
  }
  return result;
}

AssertionText ManyAudiences(std::size_t count) {
  AssertionText text;
  text.conditions =
      InsertedAfter(text.conditions, "<saml2:AudienceRestriction>",
                    Repeated("<saml2:Audience>https://c.example</saml2:Audience>", count));
  return text;
}

AssertionText ManyGroups(std::size_t count) {
  AssertionText text;
  const std::string value =
      "<saml2:AttributeValue xsi:type=\"xs:string\">A\\b</saml2:AttributeValue>";
  text.attributeStatement =
      Replaced(text.attributeStatement, "EXAMPLE\\staff</saml2:AttributeValue>",
               "EXAMPLE\\staff</saml2:AttributeValue>" + Repeated(value, count));
  return text;
}

AssertionText LongIssuer(std::size_t count) {
  AssertionText text;
  text.issuer = Replaced(text.issuer, "https://sts.example.com/STS",
                         "https://sts.example.com/STS/" + Repeated("&lt;long&#13;name&gt;", count));
  return text;
}

AssertionText ManyComments(std::size_t count) {
  AssertionText text;
  text.subject += Repeated("<!-- a comment -->\n", count);
  return text;
}

AssertionText ManyPrefixes(std::size_t count) {
  AssertionText text;
  text.conditions =
      Replaced(text.conditions, "<saml2:AudienceRestriction>",
               "<saml2:AudienceRestriction>" +
                   Repeated("<a:Audience xmlns:a=\"urn:oasis:names:tc:SAML:2.0:assertion\" "
                            "xmlns:b=\"urn:b\">https://c.example</a:Audience>",
                            count));
  return text;
}

double SecondsOf(const std::function<void()>& action) {
  double best = 1e9;
  for (int attempt = 0; attempt < 5; ++attempt) {
    const std::clock_t start = std::clock();
    action();
    best = std::min(best, static_cast<double>(std::clock() - start) / CLOCKS_PER_SEC);
  }
  return best;
}

struct Shape {
  const char* name;
  AssertionText (*make)(std::size_t);
  std::size_t count;
};

void PrintTo(const Shape& shape, std::ostream* stream) {
  *stream << shape.name;
}

class TokenScalingTest : public testing::TestWithParam<Shape> {
 protected:
  static std::string SignedXml(std::size_t factor) {
    return GetParam().make(GetParam().count * factor).ToSignedXml(TrustedCredential());
  }

  // Each doubling may take 2.5 times as long; a quadratic step takes four times as long.
  static void ExpectLinear(const std::function<void(const std::string&)>& use) {
    const std::string small = SignedXml(1);
    const std::string large = SignedXml(4);
    const double smallTime = SecondsOf([&] { use(small); });
    const double largeTime = SecondsOf([&] { use(large); });
    EXPECT_LT(largeTime, 2.5 * 2.5 * std::max(smallTime, 1e-3));
  }

  const Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> resolver_ = TrustedResolver();
};

TEST_P(TokenScalingTest, VerifyingATextIsLinear) {
  ExpectLinear([&](const std::string& xml) { CreateSamlToken(xml, resolver_.get()); });
}

TEST_P(TokenScalingTest, VerifyingAnElementAndItsCanonicalTextIsLinear) {
  ExpectLinear([&](const std::string& xml) {
    const auto document = ParseXml(xml);
    CreateSamlTokenFromDom(document->RootElement(), resolver_.get());
  });
}

INSTANTIATE_TEST_SUITE_P(Shapes, TokenScalingTest,
                         testing::Values(Shape{"ManyAudiences", ManyAudiences, 2000},
                                         Shape{"ManyGroups", ManyGroups, 1500},
                                         Shape{"LongIssuer", LongIssuer, 5000},
                                         Shape{"ManyComments", ManyComments, 4000},
                                         Shape{"ManyPrefixes", ManyPrefixes, 1500}),
                         [](const auto& test) { return test.param.name; });

}  // namespace
}  // namespace SsoClient::Testing
