// Token cases about the text and its values.
#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

#include "support/assertion_text.h"
#include "support/forgeries.h"
#include "support/token_cases.h"
#include "support/token_edits.h"

namespace SsoClient::Testing {
namespace {

constexpr const char* kDelegation = "2024-03-05T07:08:09.010Z";

std::string SignedText(const AssertionText& text) {
  return text.ToSignedXml(TrustedCredential());
}

const std::string& Delegated() {
  static const std::string xml = SignedText(AssertionText().Delegate());
  return xml;
}

std::string Times(std::size_t count, const std::string& text) {
  std::string result;
  result.reserve(count * text.size());
  for (std::size_t i = 0; i < count; ++i) {
    result += text;
  }
  return result;
}

}  // namespace

const std::vector<TokenCases>& AllTokenCases() {
  static const std::vector<TokenCases> all{{"Wrapping", WrappingCases},
                                           {"SignaturePlace", SignaturePlaceCases},
                                           {"SignatureParts", SignaturePartCases},
                                           {"Ids", IdCases},
                                           {"Namespaces", NamespaceCases},
                                           {"Transforms", TransformCases},
                                           {"Algorithms", AlgorithmCases},
                                           {"SignatureValue", SignatureValueCases},
                                           {"KeyInfo", KeyInfoCases},
                                           {"Untrusted", UntrustedCases},
                                           {"SplitValues", SplitValueCases},
                                           {"Edits", EditCases},
                                           {"DocumentTypes", DocumentTypeCases},
                                           {"Encodings", EncodingCases},
                                           {"Attributes", AttributeCases},
                                           {"Sizes", SizeCases},
                                           {"Numbers", NumberCases},
                                           {"Dates", DateCases},
                                           {"WhiteSpace", WhiteSpaceCases}};
  return all;
}

// A comment does not change the canonical form, so the signature stays valid.
std::vector<TokenCase> SplitValueCases() {
  std::vector<TokenCase> cases;
  for (const SplitValue& split : SplitValues()) {
    for (const char* node : {"<!---->", "<?p?>", "<x/>"}) {
      cases.push_back({std::string(split.name) + " by " + node, SplitBy(Delegated(), split, node),
                       Fate::kNotAToken});
    }
    cases.push_back({std::string(split.name) + " by text",
                     SplitBy(Delegated(), split, "<![CDATA[]]>"), Fate::kAccepted});
  }
  return cases;
}

std::vector<TokenCase> EditCases() {
  std::vector<TokenCase> cases;
  for (const Edit& edit : NeutralEdits()) {
    cases.push_back({edit.to, Replaced(Delegated(), edit.from, edit.to), Fate::kAccepted});
  }
  for (const Edit& edit : ValueEdits()) {
    const bool isOfIssuer = std::string_view(edit.from) == "https://sts.example.com/STS";
    cases.push_back({edit.to, Replaced(Delegated(), edit.from, edit.to),
                     isOfIssuer ? Fate::kNoTrustedKey : Fate::kBadSignature});
  }
  return cases;
}

std::vector<TokenCase> DocumentTypeCases() {
  const std::string xml = OriginalAssertion();
  std::vector<TokenCase> cases{{"none", "<?xml version=\"1.0\"?>" + xml, Fate::kAccepted}};
  for (const std::string type :
       {"<!DOCTYPE a>", "<!DOCTYPE a [<!ENTITY e \"x\">]>", "<!DOCTYPE a SYSTEM \"file:///etc\">",
        "<!DOCTYPE a PUBLIC \"p\" \"http://127.0.0.1/\">",
        "<!DOCTYPE a [<!ENTITY % p SYSTEM \"http://127.0.0.1:1/\"> %p;]>"}) {
    cases.push_back({type, type + xml, Fate::kNotXml});
  }
  cases.push_back({"undeclared entity", Replaced(xml, "Archer", "&e;"), Fate::kNotXml});
  return cases;
}

std::vector<TokenCase> EncodingCases() {
  const std::string xml = OriginalAssertion();
  const std::string mark = "\xEF\xBB\xBF";
  std::vector<TokenCase> cases{
      {"UTF-8", "<?xml version='1.0' encoding='UTF-8'?>" + xml, Fate::kAccepted},
      {"byte order mark", mark + xml, Fate::kAccepted},
      {"mark against declaration", mark + "<?xml version='1.0' encoding='UTF-16'?>" + xml,
       Fate::kNotXml}};
  for (const char* encoding : {"UTF-16", "UTF-7", "ISO-8859-1", "UTF-32", "EBCDIC"}) {
    cases.push_back({encoding,
                     std::string("<?xml version='1.0' encoding='") + encoding + "'?>" + xml,
                     Fate::kNotXml});
  }
  for (const std::string& bytes :
       {std::string("\xC0\x80"), std::string("\xED\xA0\x80"), std::string(1, '\0'),
        std::string("\xEF\xBF\xBE"), std::string("\xF4\x90\x80\x80"), std::string("&#0;")}) {
    cases.push_back(
        {"bytes " + std::to_string(cases.size()), Replaced(xml, "Archer", bytes), Fate::kNotXml});
  }
  std::string wide;
  for (const char c : xml) {
    wide.append({c, '\0'});
  }
  cases.push_back({"UTF-16 with its mark", "\xFF\xFE" + wide, Fate::kNotXml});
  return cases;
}

std::vector<TokenCase> AttributeCases() {
  const std::string xml = OriginalAssertion();
  const std::string order = R"(Postdatable="false" RenewExpired="true")";
  return {
      {"other order", Replaced(xml, order, R"(RenewExpired="true" Postdatable="false")"),
       Fate::kAccepted},
      {"one name twice", Replaced(xml, order, order + R"( Postdatable="false")"), Fate::kNotXml},
      {"two prefixes of one URI",
       Replaced(xml, order, order + R"( xmlns:y="urn:y" xmlns:z="urn:y" y:a="" z:a="")"),
       Fate::kNotXml},
      {"an unknown one", Replaced(xml, order, order + R"( Other="")"), Fate::kNotAToken}};
}

std::vector<TokenCase> SizeCases() {
  constexpr std::size_t kMany = 100'000;
  AssertionText deep;
  deep.tail = Times(kMany, "<x>");
  AssertionText nested;
  nested.tail = Times(1000, "<x>") + Times(1000, "</x>");
  std::string attributes;
  for (std::size_t i = 0; i < kMany; ++i) {
    attributes += " a" + std::to_string(i) + "=\"\"";
  }
  const std::string xml = OriginalAssertion();
  const std::string reference = R"(<ds:Reference URI=""><ds:DigestMethod Algorithm="a"/>)"
                                R"(<ds:DigestValue>AA==</ds:DigestValue></ds:Reference>)";
  AssertionText longValue;
  longValue.advice =
      Replaced(longValue.advice, "urn:source", "urn:" + std::string(std::size_t{1} << 20U, 's'));
  return {{"depth that ends nowhere", deep.ToXml(), Fate::kNotXml},
          {"depth", nested.ToXml(), Fate::kRefused},
          {"many attributes", Replaced(xml, "<saml2:Subject>", "<saml2:Subject" + attributes + ">"),
           Fate::kRefused},
          {"many references",
           Replaced(xml, "</ds:SignedInfo>", Times(kMany, reference) + "</ds:SignedInfo>"),
           Fate::kRefused},
          {"long attribute", SignedText(longValue), Fate::kAccepted}};
}

std::vector<TokenCase> NumberCases() {
  std::vector<TokenCase> cases;
  for (const CountText& count : CountTexts()) {
    AssertionText text;
    text.conditions =
        Replaced(text.conditions, "Count=\"10\"", "Count=\"" + std::string(count.text) + "\"");
    cases.push_back({std::string("'") + count.text + "'", SignedText(text),
                     count.count ? Fate::kAccepted : Fate::kNotAToken});
  }
  return cases;
}

std::vector<TokenCase> DateCases() {
  std::vector<TokenCase> cases;
  for (const DateText& date : DateTexts()) {
    AssertionText text = AssertionText().Delegate();
    text.conditions = Replaced(text.conditions, kDelegation, date.text);
    cases.push_back({"'" + date.text + "'", SignedText(text),
                     date.canonical.empty() ? Fate::kNotAToken : Fate::kAccepted});
  }
  return cases;
}

std::vector<TokenCase> WhiteSpaceCases() {
  AssertionText text;
  text.subject += "\r\n\t";
  text.advice = Replaced(text.advice, "urn:source", "urn:&#9;a&#10;b&#13;c");
  text.attributeStatement = Replaced(text.attributeStatement, ">Archer<", ">Ar&#13;cher\r\n<");
  const std::string xml = SignedText(text);
  // The oracle writes the character as a reference again.
  const std::string written =
      xml.find("Ar&#13;cher") != std::string::npos ? "&#13;cher" : "&#xD;cher";
  return {
      {"as signed", xml, Fate::kAccepted},
      {"another line end", Replaced(xml, "</saml2:Subject>\n", "</saml2:Subject>\r\n"),
       Fate::kAccepted},
      {"a carriage return that becomes a line feed", Replaced(xml, written, "\rcher"),
       Fate::kBadSignature},
      {"a line feed that becomes a blank", Replaced(xml, "a&#10;b", "a\nb"), Fate::kBadSignature}};
}

}  // namespace SsoClient::Testing
