#include "sts/request_builder.h"

#include <devsts/xml_security.h>
#include <gmock/gmock.h>

#include <functional>
#include <string>

// What a caller puts into a request stands there as text, however much it looks like markup: an
// independent parser reads it back.
namespace SsoClient {
namespace {

using testing::HasSubstr;

constexpr char kMarkup[] =
    "</a>&amp;&#0;<!--c--><?p?>]]><![CDATA[\"'\r\n\t\xC3\xA4\xF0\x9F\x94\x91 ";

// As canonical XML writes it (section 2.3) in a text and in an attribute.
constexpr char kInText[] =
    "&lt;/a&gt;&amp;amp;&amp;#0;&lt;!--c--&gt;&lt;?p?&gt;]]&gt;&lt;![CDATA[\"'&#xD;\n\t"
    "\xC3\xA4\xF0\x9F\x94\x91 ";
constexpr char kInAttribute[] =
    "&lt;/a>&amp;amp;&amp;#0;&lt;!--c-->&lt;?p?>]]>&lt;![CDATA[&quot;'&#xD;&#xA;&#x9;"
    "\xC3\xA4\xF0\x9F\x94\x91 ";

struct Input {
  std::string user = "alice";
  std::string password = "pw";
  TokenSpec spec;
};

struct Field {
  const char* name;
  std::function<void(Input&)> put;
  const char* element;
  std::string expected;
};

void PrintTo(const Field& field, std::ostream* stream) {
  *stream << field.name;
}

class RequestEscapingTest : public testing::TestWithParam<Field> {};

TEST_P(RequestEscapingTest, KeepsMarkupAsText) {
  Input input;
  input.spec.tokenLifetimeSec = 60;
  GetParam().put(input);
  SoapRequest request;
  RequestBuilderImpl(boost::none)
      .BuildAcquireTokenRequest(input.user, input.password, input.spec, request);
  const std::string canonical =
      DevSts::Canonicalize(request.body, GetParam().element, DevSts::CanonicalMode::Exclusive);
  EXPECT_THAT(canonical, HasSubstr(GetParam().expected));
}

const std::string kText = std::string(">") + kInText + "</";

INSTANTIATE_TEST_SUITE_P(
    Fields, RequestEscapingTest,
    testing::Values(
        Field{"User", [](Input& input) { input.user = kMarkup; },
              "//*[local-name()='UsernameToken']/*[local-name()='Username']", kText},
        Field{"Password", [](Input& input) { input.password = kMarkup; },
              "//*[local-name()='Password']", kText},
        Field{"Audience", [](Input& input) { input.spec.audienceRestriction = {kMarkup}; },
              "//*[local-name()='Address']", kText},
        Field{"DelegateTo", [](Input& input) { input.spec.delegateTo = std::string(kMarkup); },
              "//*[local-name()='DelegateTo']//*[local-name()='Username']", kText},
        Field{"AdviceSource",
              [](Input& input) {
                input.spec.advice = {{kMarkup, {}}};
              },
              "//*[@AdviceSource]", std::string("AdviceSource=\"") + kInAttribute + "\""},
        Field{"AdviceName",
              [](Input& input) {
                input.spec.advice = {{"s", {{kMarkup, {}}}}};
              },
              "//*[local-name()='Attribute']", std::string("Name=\"") + kInAttribute + "\""},
        Field{"AdviceValue",
              [](Input& input) {
                input.spec.advice = {{"s", {{"n", {kMarkup}}}}};
              },
              "//*[local-name()='AttributeValue']", kText}),
    [](const auto& tested) { return tested.param.name; });

}  // namespace
}  // namespace SsoClient
