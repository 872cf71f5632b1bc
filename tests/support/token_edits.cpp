#include "support/token_edits.h"

#include <cstddef>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include "support/assertion_text.h"

namespace SsoClient::Testing {

const std::vector<Edit>& NeutralEdits() {
  static const std::vector<Edit> edits{
      {"ID=\"_a1\"", "ID='_a1'"},
      {"ID=\"_a1\"", "ID = \n \"_a1\""},
      {"ID=\"_a1\"", "ID=\"_&#97;1\""},
      {"alice@example.com", "&#x61;lice@example.com"},
      {"alice@example.com", "<![CDATA[alice@example.com]]>"},
      {"alice@example.com", "alice<![CDATA[@]]>example.com"},
      {"EXAMPLE\\staff", "EXAMPLE&#92;staff"},
      {"<saml2:ProxyRestriction Count=\"10\"/>",
       "<saml2:ProxyRestriction Count=\"10\"></saml2:ProxyRestriction>"},
      {"<saml2:ProxyRestriction Count=\"10\"/>", "<saml2:ProxyRestriction\n  Count = '10' />"},
      {"Postdatable=\"false\" RenewExpired=\"true\"",
       "RenewExpired=\"true\" Postdatable=\"false\""},
      {"<saml2:Subject>", "<!-- a comment --><saml2:Subject>"},
      {"</saml2:Subject>", "<!----></saml2:Subject>"},
      {"<saml2:Subject>", "<saml2:Subject xmlns:unused=\"urn:unused\">"}};
  return edits;
}

const std::vector<Edit>& ValueEdits() {
  static const std::vector<Edit> edits{
      {"https://sts.example.com/STS", "https://sts.example.com/STS2"},
      {"nameid-format:entity", "nameid-format:entitx"},
      {"alice@example.com", "alicf@example.com"},
      {"https://a.example", "https://c.example"},
      {"<saml2:Audience>https://a.example</saml2:Audience>", ""},
      {"Count=\"10\"", "Count=\"11\""},
      {"Count=\"5\"", "Count=\"05\""},
      {"Postdatable=\"false\"", "Postdatable=\"0\""},
      {"RenewExpired=\"true\"", "RenewExpired=\"TRUE\""},
      {"first@example.com", "other@example.com"},
      {"2024-03-05T07:08:09.010Z", "2024-03-05T07:08:09.011Z"},
      {"urn:source", "urn:sourcf"},
      {"urn:hint", "urn:hins"},
      {">one<", ">two <"},
      {"PasswordProtectedTransport", "Password"},
      {"EXAMPLE\\staff", "EXAMPLE\\stafg"},
      {">false<", ">true<"},
      {">Alice<", ">Alicf<"},
      {">Archer<", ">Archer <"},
      {"<saml2:Subject>", "<saml2:Subject> "}};
  return edits;
}

void PrintTo(const SplitValue& split, std::ostream* stream) {
  *stream << split.name;
}

const std::vector<SplitValue>& SplitValues() {
  static const std::vector<SplitValue> values{
      {"Subject", "alice@example.com", 9},
      {"Delegate", "first@example.com", 9},
      {"Issuer", "https://sts.example.com/STS", 19},
      {"Audience", "https://a.example", 9},
      {"Group", "EXAMPLE\\admins", 13},
      {"IsSolution", ">false<", 3},
      {"GivenName", ">Alice<", 3},
      {"Surname", ">Archer<", 3},
      {"AdviceValue", ">one<", 2},
      {"AuthnContextClass", "PasswordProtectedTransport", 8}};
  return values;
}

std::string SplitBy(const std::string& xml, const SplitValue& split, const std::string& node) {
  std::string value = split.value;
  return Replaced(xml, split.value, value.insert(split.at, node));
}

const std::vector<DateText>& DateTexts() {
  static const std::vector<DateText> dates{
      {"2024-03-05T07:08:09.010Z", "2024-03-05T07:08:09.010Z"},
      {"2024-03-05T07:08:09", "2024-03-05T07:08:09.000Z"},
      {"2024-03-05T24:00:00Z", "2024-03-06T00:00:00.000Z"},
      {"2024-03-05T07:08:09.1234567Z", "2024-03-05T07:08:09.123456Z"},
      {"2024-03-05T14:00:00+14:00", "2024-03-05T00:00:00.000Z"},
      {"2024-02-29T00:00:00Z", "2024-02-29T00:00:00.000Z"},
      {"2024-03-05T23:59:60Z", ""},
      {"2024-03-05T24:00:01Z", ""},
      {"2024-03-05T07:08:09+14:01", ""},
      {"2023-02-29T00:00:00Z", ""},
      {"0000-03-05T07:08:09Z", ""},
      {"-0001-03-05T07:08:09Z", ""},
      {"10000-03-05T07:08:09Z", ""},
      {"2024-03-05T07:08:09z", ""},
      {"2024-03-05t07:08:09Z", ""},
      {" 2024-03-05T07:08:09Z", ""},
      {"2024-03-05T07:08:09Z ", ""},
      {"2024-03-05", ""},
      {"soon", ""},
      {"", ""}};
  return dates;
}

const std::vector<CountText>& CountTexts() {
  static const std::vector<CountText> counts{{"0", 0},
                                             {"-0", 0},
                                             {"+0", 0},
                                             {"+1", 1},
                                             {"007", 7},
                                             {"4294967295", 4294967295U},
                                             {"10", 10},
                                             {"0000000000000000000000001", 1},
                                             {"-1", std::nullopt},
                                             {"4294967296", std::nullopt},
                                             {"9223372036854775807", std::nullopt},
                                             {"9223372036854775808", std::nullopt},
                                             {"18446744073709551616", std::nullopt},
                                             {"-9223372036854775809", std::nullopt},
                                             {"1e3", std::nullopt},
                                             {"", std::nullopt},
                                             {" ", std::nullopt},
                                             {" 1", std::nullopt},
                                             {"1 ", std::nullopt},
                                             {"1.0", std::nullopt},
                                             {"0x10", std::nullopt},
                                             {"one", std::nullopt},
                                             {"+", std::nullopt},
                                             {"-", std::nullopt},
                                             {"+-1", std::nullopt},
                                             {"1,000", std::nullopt},
                                             {"\xD9\xA1", std::nullopt}};
  return counts;
}

}  // namespace SsoClient::Testing
