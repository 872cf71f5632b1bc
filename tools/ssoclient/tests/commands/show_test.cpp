#include <algorithm>
#include <regex>
#include <set>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>
#include <sys/stat.h>

#include <tarnik/crypto/certificate.h>

#include "support/token_files.h"

namespace SsoClient::Tool::Testing {
namespace {

using Json = nlohmann::json;
using Tarnik::System::DateTime;

DateTime MinutesFromNow(long minutes) {
  const long now = Tarnik::System::GetUtcDateTime().GetUtcTime();
  return Tarnik::System::DateTimeFromUtc(now + minutes * 60'000'000, false);
}

bool Holds(const std::string& text, const std::string& part) {
  return text.find(part) != std::string::npos;
}

bool Matches(const std::string& text, const std::string& pattern) {
  return std::regex_search(text, std::regex(pattern));
}

// The line of the text that starts with the label, without it.
std::string Row(const std::string& text, const std::string& label) {
  const std::size_t start = ("\n" + text).find("\n" + label + " ");
  if (start == std::string::npos) {
    return "no row " + label + " in:\n" + text;
  }
  const std::string line = text.substr(start, text.find('\n', start) - start);
  return line.substr(line.find_first_not_of(' ', label.size()));
}

std::string FingerprintOf(const DevSts::Credential& credential) {
  return Tarnik::Crypto::FingerprintText(
      *Tarnik::Crypto::CreateCertificatesFromPem(credential.certificatePem).front());
}

DevSts::Credential MakeHolder() {
  DevSts::CertificateSpec spec;
  spec.commonName = "holder";
  return DevSts::MakeCertificate(spec);
}

class ShowTest : public ::testing::Test {
 protected:
  ToolResult Show(const AssertionText& text) const {
    return RunInUtf8({"show", files.WriteToken(text)});
  }
  Json ShowJson(const AssertionText& text) const {
    return RunInUtf8({"show", "--json", files.WriteToken(text)}).Json();
  }

  const TokenFiles files;
};

TEST_F(ShowTest, SaysWhatTheTokenSays) {
  const ToolResult shown = Show(AssertionText());
  EXPECT_EQ(shown.status, 0) << shown.err;
  EXPECT_EQ(shown.err, "");
  EXPECT_EQ(Row(shown.out, "subject"), "alice@example.com");
  EXPECT_EQ(Row(shown.out, "name"), "Alice Archer");
  EXPECT_TRUE(Holds(shown.out, "EXAMPLE\\staff\n              EXAMPLE\\admins\n")) << shown.out;
  EXPECT_TRUE(Holds(shown.out, "https://a.example\n              https://b.example\n"));
  EXPECT_EQ(Row(shown.out, "delegated"), "no");
  EXPECT_EQ(Row(shown.out, "flags"), "renewable, delegable");
  EXPECT_EQ(Row(shown.out, "confirmation"), "bearer: whoever has it can use it");
  EXPECT_EQ(Row(shown.out, "issuer"), kTokenIssuer);
  EXPECT_EQ(Row(shown.out, "signer"), "CN=STS");
  EXPECT_TRUE(Holds(shown.out, "SHA-256 " + FingerprintOf(TrustedCredential())));
  EXPECT_EQ(Row(shown.out, "algorithm"), "ECDSA with SHA-256");
  EXPECT_TRUE(Holds(shown.out, "from urn:source\n              urn:hint: one, two\n"));
  EXPECT_EQ(Row(shown.out, "id"), "_a1");
  EXPECT_EQ(Row(shown.out, "lifetime"), "1 h 1 min");
}

TEST_F(ShowTest, SaysThatItHasNotVerifiedTheToken) {
  AssertionText text;
  text.subject = Replaced(text.subject, ">alice@", ">mallory@");
  const std::string forged =
      Replaced(AssertionText().ToSignedXml(TrustedCredential()), ">alice@", ">mallory@");
  const ToolResult shown = RunInUtf8({"show", files.Write("forged.xml", forged)});
  EXPECT_EQ(shown.status, 0);
  EXPECT_EQ(Row(shown.out, "subject"), "mallory@example.com");
  EXPECT_TRUE(Holds(shown.out, "not verified: use 'ssoclient verify'\n"));
  EXPECT_EQ(ShowJson(text).at("isVerified"), false);
}

TEST_F(ShowTest, NeverShowsTheTextOrTheSignature) {
  const std::string xml = AssertionText().ToSignedXml(TrustedCredential());
  const std::string path = files.Write("token.xml", xml);
  const std::string begin = "SignatureValue>";
  const std::size_t start = xml.find(begin) + begin.size();
  const std::string signature = xml.substr(start, 20);
  ASSERT_EQ(signature.find('<'), std::string::npos);
  for (const ToolResult& shown : {RunInUtf8({"show", path}), RunInUtf8({"show", "--json", path})}) {
    EXPECT_FALSE(Holds(shown.out, signature));
    EXPECT_FALSE(Holds(shown.out, "<saml2:"));
    EXPECT_FALSE(Holds(shown.out, "SignatureValue"));
  }
}

// Seconds may pass before the program reads the clock.
TEST_F(ShowTest, ShowsWhereInItsValidityTheTokenIs) {
  const ToolResult valid = Show(AssertionText(MinutesFromNow(-29)));
  EXPECT_TRUE(Holds(Row(valid.out, "validity"), "●")) << valid.out;
  EXPECT_TRUE(Matches(valid.out, R"(valid for 30 min( \d+ s)? \(49 % have elapsed\))"))
      << valid.out;

  const ToolResult expired = Show(AssertionText(MinutesFromNow(-63)));
  EXPECT_EQ(expired.status, 0);
  EXPECT_TRUE(Row(expired.out, "validity").ends_with("━┤ ●")) << expired.out;
  EXPECT_TRUE(Matches(expired.out, R"(expired 3 min( \d+ s)? ago \(100 % have elapsed\))"))
      << expired.out;

  const ToolResult future = Show(AssertionText(MinutesFromNow(24 * 60 + 1)));
  EXPECT_EQ(future.status, 0);
  EXPECT_TRUE(Row(future.out, "validity").starts_with("● ├─")) << future.out;
  EXPECT_TRUE(Holds(future.out, "not valid yet: valid in 23 h 59 min (0 % have elapsed)"))
      << future.out;
}

TEST_F(ShowTest, NamesTheKeyOfAHolderOfKeyToken) {
  const DevSts::Credential holder = MakeHolder();
  AssertionText text;
  text.ConfirmByKey(holder.certificatePem);
  const ToolResult shown = Show(text);
  EXPECT_EQ(Row(shown.out, "confirmation"), "holder of the key of");
  EXPECT_TRUE(Holds(shown.out, "CN=holder\n"));
  EXPECT_TRUE(Holds(shown.out, "SHA-256 " + FingerprintOf(holder)));
  const Json json = ShowJson(text);
  EXPECT_EQ(json.at("confirmation"), "holder-of-key");
  EXPECT_EQ(json.at("holder").at("subject"), "CN=holder");
  EXPECT_EQ(json.at("holder").at("sha256"), FingerprintOf(holder));
}

TEST_F(ShowTest, ShowsTheChainOfDelegation) {
  AssertionText text;
  text.Delegate();
  const ToolResult shown = Show(text);
  EXPECT_EQ(Row(shown.out, "delegated"), "to first@example.com on 2024-03-05 07:08:09 UTC");
  EXPECT_TRUE(Holds(shown.out, "   to second@example.com on 2024-03-05 07:08:10 UTC\n"));
  const Json chain = ShowJson(text).at("delegationChain");
  ASSERT_EQ(chain.size(), 2U);
  EXPECT_EQ(
      chain[0],
      Json({{"name", "first"}, {"domain", "example.com"}, {"since", "2024-03-05T07:08:09.010Z"}}));
}

TEST_F(ShowTest, ATokenMaySayLittle) {
  AssertionText text;
  text.conditions =
      Replaced(text.conditions, text.conditions.substr(text.conditions.find("<saml2:AudienceR")),
               "</saml2:Conditions>");
  text.advice.clear();
  text.attributeStatement.clear();
  const ToolResult shown = Show(text);
  EXPECT_EQ(shown.status, 0) << shown.err;
  EXPECT_EQ(Row(shown.out, "groups"), "none");
  EXPECT_EQ(Row(shown.out, "audiences"), "not restricted to any");
  EXPECT_EQ(Row(shown.out, "flags"), "none");
  EXPECT_FALSE(Holds(shown.out, "\nname "));
  EXPECT_FALSE(Holds(shown.out, "\nadvice "));
}

TEST_F(ShowTest, TheSignerMayBeMissing) {
  DevSts::SignOptions options;
  options.keyInfo = DevSts::KeyInfoContent::None;
  const std::string xml = AssertionText().ToSignedXml(TrustedCredential(), options);
  const std::string path = files.Write("token.xml", xml);
  const ToolResult shown = RunInUtf8({"show", path});
  EXPECT_EQ(Row(shown.out, "signer"), "the token contains no certificate");
  EXPECT_FALSE(RunInUtf8({"show", "--json", path}).Json().contains("signer"));
}

// The names are those of docs/tool.md, which a test compares with this program, too.
TEST_F(ShowTest, TheNamesOfTheJsonObjectAreStable) {
  AssertionText text;
  text.ConfirmByKey(MakeHolder().certificatePem);
  const Json json = ShowJson(text);
  std::set<std::string> names;
  for (const auto& [name, value] : json.items()) {
    names.insert(name);
  }
  EXPECT_EQ(names, (std::set<std::string>{"advice",       "audiences",       "command",
                                          "confirmation", "delegationChain", "elapsedPercent",
                                          "groups",       "holder",          "id",
                                          "isDelegable",  "isRenewable",     "isSolution",
                                          "isVerified",   "issuer",          "lifetime",
                                          "names",        "notBefore",       "notOnOrAfter",
                                          "now",          "remaining",       "signatureAlgorithm",
                                          "signer",       "state",           "status",
                                          "subject"}));
  EXPECT_EQ(json.at("command"), "show");
  EXPECT_EQ(json.at("status"), "done");
  EXPECT_EQ(json.at("subject"), Json({{"name", "alice"}, {"domain", "example.com"}}));
  EXPECT_EQ(json.at("names"), Json({{"givenName", "Alice"}, {"surname", "Archer"}}));
  EXPECT_EQ(json.at("groups")[0], Json({{"name", "staff"}, {"domain", "EXAMPLE"}}));
  EXPECT_EQ(json.at("audiences"), Json({"https://a.example", "https://b.example"}));
  EXPECT_EQ(json.at("advice"), Json::parse(R"([{"source": "urn:source",
                             "attributes": [{"name": "urn:hint", "values": ["one", "two"]}]}])"));
  EXPECT_EQ(json.at("lifetime"), 3660);
  EXPECT_EQ(json.at("state"), "valid");
  EXPECT_EQ(json.at("isRenewable"), true);
  EXPECT_EQ(json.at("isSolution"), false);
}

TEST_F(ShowTest, TextsOfTheTokenCannotControlTheTerminal) {
  // XML 1.0 admits these controls of C1, DEL and the characters that change the direction of text.
  AssertionText text;
  text.attributeStatement = Replaced(text.attributeStatement, ">Alice<",
                                     ">\u009b31mRed \u202eecilA\x7f&#xD;&#xA;groups  root<");
  const std::string path = files.WriteToken(text);
  const std::string shown = RunOnTerminal({"show", path}, {{"NO_COLOR", "1"}}).terminal;
  EXPECT_TRUE(Holds(shown, "?31mRed ?ecilA???groups  root Archer")) << shown;
  EXPECT_FALSE(Holds(shown, "\u009b"));
  EXPECT_FALSE(Holds(shown, "\u202e"));
  EXPECT_FALSE(Holds(shown, "\x1b"));

  const ToolResult json = RunInUtf8({"show", "--json", path});
  EXPECT_FALSE(Holds(json.out, "\u009b"));
  EXPECT_EQ(json.Json().at("names").at("givenName"),
            "\u009b31mRed \u202eecilA\x7f\r\ngroups  root");
}

TEST_F(ShowTest, ColoursAreForTerminalsOnly) {
  const std::string path = files.WriteToken(AssertionText());
  EXPECT_TRUE(Holds(RunOnTerminal({"show", path}).terminal, "\x1b[32m"));
  EXPECT_FALSE(Holds(RunOnTerminal({"show", path}, {{"NO_COLOR", "1"}}).terminal, "\x1b"));
  EXPECT_TRUE(Holds(RunOnTerminal({"show", path}, {{"NO_COLOR", ""}}).terminal, "\x1b[32m"));
  EXPECT_FALSE(Holds(RunOnTerminal({"show", path}, {{"TERM", "dumb"}}).terminal, "\x1b"));
  EXPECT_FALSE(Holds(RunInUtf8({"show", path}).out, "\x1b"));
}

TEST_F(ShowTest, WritesAsciiInALocaleThatIsNotUtf8) {
  AssertionText text;
  text.attributeStatement = Replaced(text.attributeStatement, ">Alice<", ">Émile<");
  const std::string path = files.WriteToken(text);
  const std::string shown = RunOnTerminal({"show", path}, {{"LC_ALL", "C"}}).terminal;
  EXPECT_TRUE(Holds(shown, "<U+00C9>mile Archer"));
  EXPECT_TRUE(std::all_of(shown.begin(), shown.end(), [](char c) {
    return static_cast<unsigned char>(c) < 0x80;
  })) << shown;
}

TEST_F(ShowTest, ReadsStandardInput) {
  const ToolResult shown =
      RunInUtf8({"show", "-"}, AssertionText().ToSignedXml(TrustedCredential()) + "\n");
  EXPECT_EQ(shown.status, 0) << shown.err;
  EXPECT_EQ(Row(shown.out, "id"), "_a1");
}

TEST_F(ShowTest, WhatIsNoTokenIsALocalFailure) {
  for (const std::string text : {"hello", "<a/>", "<a>\x1b[31m</b>"}) {
    const std::string path = files.Write("token.xml", text);
    const ToolResult shown = RunInUtf8({"show", path});
    EXPECT_EQ(shown.status, 4);
    EXPECT_EQ(shown.out, "");
    EXPECT_TRUE(shown.err.starts_with("ssoclient: This is not a token: ")) << shown.err;
    EXPECT_TRUE(Holds(shown.err, "\n  remedy: "));
    EXPECT_FALSE(Holds(shown.err, "\x1b"));
    const Json json = RunInUtf8({"show", "--json", path}).Json();
    EXPECT_EQ(json.at("status"), "local");
    EXPECT_EQ(json.at("error").at("kind"), "not-a-token");
  }
}

TEST_F(ShowTest, RefusesFilesThatOthersCanRead) {
  const std::string path = files.WriteToken(AssertionText());
  chmod(path.c_str(), 0644);
  EXPECT_EQ(RunInUtf8({"show", path}).status, 4);
  EXPECT_EQ(RunInUtf8({"show", "--allow-open-files", path}).status, 0);
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
