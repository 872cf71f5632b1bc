#include <set>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>
#include <openssl/evp.h>
#include <unistd.h>

#include "support/token_files.h"

namespace SsoClient::Tool::Testing {
namespace {

using Json = nlohmann::json;
using Tarnik::System::DateTime;
using Tarnik::Testing::Identity;

bool Holds(const std::string& text, const std::string& part) {
  return text.find(part) != std::string::npos;
}

const Identity& Authority() {
  static const Identity identity = Tarnik::Testing::MakeCa("authority");
  return identity;
}

const Identity& Signer() {
  static const Identity identity =
      Tarnik::Testing::MakeIdentity({.commonName = "signer"}, &Authority());
  return identity;
}

const Identity& Holder() {
  static const Identity identity = Tarnik::Testing::MakeIdentity({.commonName = "holder"}, nullptr);
  return identity;
}

const Identity& Thief() {
  static const Identity identity = Tarnik::Testing::MakeIdentity({.commonName = "thief"}, nullptr);
  return identity;
}

/// Trusts the certificate of `Signer` for tokens of the tests' issuer.
class VerifyTest : public ::testing::Test {
 protected:
  using Arguments = std::vector<std::string>;

  Arguments Complete(Arguments options) const {
    Arguments all{"verify", "--sts-certificate", trust, "--issuer", kTokenIssuer};
    all.insert(all.end(), options.begin(), options.end());
    return all;
  }
  ToolResult Verify(const AssertionText& text, Arguments options) const {
    options.push_back(files.WriteToken(text, CredentialOf(Signer())));
    return RunInUtf8(Complete(std::move(options)));
  }
  /// With the audience of the tests, and bearer tokens accepted.
  ToolResult VerifyForAudience(const AssertionText& text, Arguments options = {}) const {
    Arguments all{"--audience", kTokenAudience, "--bearer", "accept"};
    all.insert(all.end(), options.begin(), options.end());
    return Verify(text, all);
  }
  /// Expects a refusal that the table, the decision and the JSON object agree about.
  void ExpectRefused(const AssertionText& text, Arguments options, const std::string& reason,
                     const std::string& check, const std::string& remedy = "new-token") const {
    const ToolResult result = VerifyForAudience(text, options);
    EXPECT_EQ(result.status, 1) << result.err;
    EXPECT_TRUE(Holds(result.out, "✗  " + check + " ")) << result.out;
    EXPECT_TRUE(Holds(result.out, "\nrefused (" + reason + "): ")) << result.out;
    EXPECT_TRUE(Holds(result.out, "\n  remedy: "));
    EXPECT_TRUE(Holds(result.out, "  not reached\n") || check == "predicate");
    options.push_back("--json");
    const Json json = VerifyForAudience(text, options).Json();
    EXPECT_EQ(json.at("status"), "refused");
    EXPECT_FALSE(json.contains("error"));
    EXPECT_EQ(json.at("isAccepted"), false);
    EXPECT_EQ(json.at("reason"), reason);
    EXPECT_EQ(json.at("remedy"), remedy);
  }
  std::string HolderPath() const { return files.Write("holder.pem", Holder().Pem()); }

  const TokenFiles files;
  const std::string trust = files.Write("signer.pem", Signer().Pem());
};

AssertionText BoundText() {
  AssertionText text;
  text.ConfirmByKey(Holder().Pem());
  return text;
}

DateTime HoursFromNow(long hours) {
  const long now = Tarnik::System::GetUtcDateTime().GetUtcTime();
  return Tarnik::System::DateTimeFromUtc(now + hours * 3'600'000'000, false);
}

TEST_F(VerifyTest, PrintsEachCheckOfAnAcceptedToken) {
  const ToolResult result = VerifyForAudience(AssertionText());
  EXPECT_EQ(result.status, 0) << result.out << result.err;
  for (const char* check :
       {"size", "well-formed", "layout", "validity", "signer-known", "signer-valid",
        "signer-revoked", "signature", "audience", "confirmation", "possession", "lifetime",
        "delegation", "groups", "predicate"}) {
    EXPECT_TRUE(Holds("\n" + result.out, std::string("\n✓  ") + check + " ")) << result.out;
  }
  EXPECT_TRUE(Holds(result.out, "\n\naccepted: alice@example.com, valid for ")) << result.out;
}

TEST_F(VerifyTest, PrintsOneJsonObject) {
  const Json json = VerifyForAudience(AssertionText(), {"--json"}).Json();
  std::set<std::string> names;
  for (const auto& [name, value] : json.items()) {
    names.insert(name);
  }
  EXPECT_EQ(names, (std::set<std::string>{"checkedAt", "checks", "command", "isAccepted", "status",
                                          "token"}));
  EXPECT_EQ(json.at("status"), "done");
  EXPECT_EQ(json.at("isAccepted"), true);
  ASSERT_EQ(json.at("checks").size(), 15U);
  EXPECT_EQ(json.at("checks")[0].at("check"), "size");
  EXPECT_EQ(json.at("checks")[0].at("outcome"), "passed");
  EXPECT_TRUE(json.at("checks")[0].contains("compared"));
  EXPECT_EQ(json.at("token").at("subject").at("name"), "alice");
}

TEST_F(VerifyTest, AForgedTokenIsRefused) {
  const std::string xml = AssertionText().ToSignedXml(CredentialOf(Signer()));
  const std::string forged = files.Write("forged.xml", Replaced(xml, ">alice@", ">mallory@"));
  const ToolResult result =
      RunInUtf8(Complete({"--audience", kTokenAudience, "--bearer", "accept", forged}));
  EXPECT_EQ(result.status, 1);
  EXPECT_TRUE(Holds(result.out, "✗  signature ")) << result.out;
  EXPECT_TRUE(Holds(result.out, "\nrefused (bad-signature): ")) << result.out;
  EXPECT_TRUE(Holds(result.out, "–  audience        not reached\n")) << result.out;
}

TEST_F(VerifyTest, WhatIsNoTokenIsRefused) {
  const Arguments options{"--audience", kTokenAudience, "-"};
  EXPECT_TRUE(Holds(RunInUtf8(Complete(options), "hello").out, "refused (not-well-formed): "));
  EXPECT_TRUE(Holds(RunInUtf8(Complete(options), "<a/>").out, "refused (bad-layout): "));
  EXPECT_EQ(RunInUtf8(Complete(options), "<a/>").status, 1);
}

TEST_F(VerifyTest, TimesAreThoseOfNowOrOfAnotherMoment) {
  ExpectRefused(AssertionText(HoursFromNow(-2)), {}, "expired", "validity");
  ExpectRefused(AssertionText(HoursFromNow(2)), {}, "not-yet-valid", "validity");
  const ToolResult tolerated =
      VerifyForAudience(AssertionText(HoursFromNow(-2)), {"--clock-tolerance", "2h"});
  EXPECT_EQ(tolerated.status, 0);
  EXPECT_TRUE(Holds(tolerated.out, " ago (within the clock tolerance)\n")) << tolerated.out;
  // The certificate of the signer was valid then, too.
  const AssertionText text{
      Tarnik::System::DateTimeFromUtc(HoursFromNow(0).GetUtcTime() - 3'700'000'000, false)};
  EXPECT_EQ(VerifyForAudience(text, {"--clock-tolerance", "0"}).status, 1);
  const ToolResult then = VerifyForAudience(
      text, {"--clock-tolerance", "0", "--at",
             Tarnik::System::DateTimeFromUtc(HoursFromNow(0).GetUtcTime() - 1'800'000'000, false)
                 .ToString()});
  EXPECT_EQ(then.status, 0) << then.out;
  EXPECT_TRUE(Holds(then.out, "\nas of 20")) << then.out;
  // The option is proposed unless it was used.
  EXPECT_TRUE(Holds(VerifyForAudience(AssertionText(HoursFromNow(-2))).out, "\n  hint: --at "));
  EXPECT_FALSE(
      Holds(VerifyForAudience(text, {"--at", "2020-01-01T00:00:00Z"}).out, "\n  hint: --at "));
}

TEST_F(VerifyTest, OnlyTrustedSignersCount) {
  AssertionText text;
  text.issuer = Replaced(text.issuer, kTokenIssuer, "https://other.example");
  ExpectRefused(text, {}, "unknown-issuer", "signer-known");

  const std::string path = files.WriteToken(AssertionText(), CredentialOf(Thief()));
  const ToolResult stranger =
      RunInUtf8(Complete({"--audience", kTokenAudience, "--bearer", "accept", path}));
  EXPECT_EQ(stranger.status, 1);
  EXPECT_TRUE(Holds(stranger.out, "refused (unknown-signer): ")) << stranger.out;
}

TEST_F(VerifyTest, TrustMayBeForOneIssuerOrForAny) {
  const std::string path = files.WriteToken(AssertionText(), CredentialOf(Signer()));
  const Arguments end{"--audience", kTokenAudience, "--bearer", "accept", path};
  const auto run = [&end](Arguments all) {
    all.insert(all.begin(), "verify");
    all.insert(all.end(), end.begin(), end.end());
    return RunInUtf8(all).status;
  };
  EXPECT_EQ(run({"--sts-certificate", trust}), 0);
  EXPECT_EQ(run({"--trust-for", kTokenIssuer, trust}), 0);
  EXPECT_EQ(run({"--trust-for", "https://other.example", trust}), 1);
  EXPECT_EQ(
      run({"--trust-for", "https://other.example", trust, "--trust-for", kTokenIssuer, trust}), 0);
  EXPECT_EQ(run({"--sts-certificate", trust, "--issuer", "https://other.example"}), 1);
  EXPECT_EQ(run({"--issuer", kTokenIssuer}), 2);
}

TEST_F(VerifyTest, TheVariableIsUsedOnlyIfNoOptionNamesTrust) {
  ToolOptions options;
  options.environment = {{"SSOCLIENT_STS_CERTIFICATE", trust}};
  const std::string path = files.WriteToken(AssertionText(), CredentialOf(Signer()));
  const std::string other = files.Write("other.pem", Holder().Pem());
  const auto run = [&](const Arguments& arguments) {
    options.arguments = {"verify", "--audience", kTokenAudience, "--bearer", "accept", path};
    options.arguments.insert(options.arguments.end(), arguments.begin(), arguments.end());
    return RunTool(options).status;
  };
  EXPECT_EQ(run({}), 0);
  EXPECT_EQ(run({"--issuer", kTokenIssuer}), 0);
  EXPECT_EQ(run({"--issuer", "https://other.example"}), 1);
  EXPECT_EQ(run({"--sts-certificate", other}), 1);
  EXPECT_EQ(run({"--trust-for", "https://other.example", trust}), 1);
}

TEST_F(VerifyTest, CertificatesOfSignersHaveDates) {
  const Identity old =
      Tarnik::Testing::MakeIdentity({.commonName = "old", .notAfter = -1800}, nullptr);
  const Identity coming = Tarnik::Testing::MakeIdentity(
      {.commonName = "coming", .notBefore = 1800, .notAfter = 7200}, nullptr);
  for (const auto& [identity, reason] :
       {std::pair(&old, "signer-expired"), std::pair(&coming, "signer-not-yet-valid")}) {
    const std::string token = files.WriteToken(AssertionText(), CredentialOf(*identity));
    const ToolResult result =
        RunInUtf8({"verify", "--sts-certificate", files.Write("signer.crt", identity->Pem()),
                   "--audience", kTokenAudience, "--bearer", "accept", token});
    EXPECT_EQ(result.status, 1);
    EXPECT_TRUE(Holds(result.out, std::string("refused (") + reason + "): ")) << result.out;
  }
}

TEST_F(VerifyTest, RevocationListsCount) {
  const std::string authority = files.Write("authority.pem", Authority().Pem());
  const auto options = [&](const std::string& list) {
    return Arguments{"--crl", files.Write("list.crl", list), "--list-signer", authority};
  };
  using Tarnik::Testing::MakeCrl;
  EXPECT_EQ(VerifyForAudience(AssertionText(), options(MakeCrl(Authority(), nullptr))).status, 0);
  ExpectRefused(AssertionText(), options(MakeCrl(Authority(), &Signer())), "signer-revoked",
                "signer-revoked");
  ExpectRefused(AssertionText(), options(MakeCrl(Authority(), nullptr, -1800)),
                "revocation-unknown", "signer-revoked", "service");
}

TEST_F(VerifyTest, TheAudienceMustBeTheService) {
  EXPECT_EQ(VerifyForAudience(AssertionText()).status, 0);
  const ToolResult other =
      Verify(AssertionText(), {"--audience", "https://c.example", "--bearer", "accept"});
  EXPECT_EQ(other.status, 1);
  EXPECT_TRUE(Holds(other.out, "refused (wrong-audience): ")) << other.out;
  EXPECT_EQ(Verify(AssertionText(), {"--audience", "https://c.example", "--audience",
                                     "https://b.example", "--bearer", "accept"})
                .status,
            0);
}

TEST_F(VerifyTest, UnrestrictedTokensAreRefusedUnlessAccepted) {
  AssertionText text;
  const std::size_t start = text.conditions.find("<saml2:AudienceR");
  text.conditions.erase(start, text.conditions.find("<saml2:ProxyR") - start);
  ExpectRefused(text, {}, "unrestricted", "audience");
  EXPECT_EQ(VerifyForAudience(text, {"--accept-unrestricted"}).status, 0);
}

TEST_F(VerifyTest, BearerTokensAreRefusedUnlessAccepted) {
  const ToolResult result = Verify(AssertionText(), {"--audience", kTokenAudience});
  EXPECT_EQ(result.status, 1);
  EXPECT_TRUE(Holds(result.out, "refused (bearer-refused): ")) << result.out;
  EXPECT_TRUE(Holds(result.out, "\n  hint: --bearer accept")) << result.out;
}

TEST_F(VerifyTest, ThePresenterMustHaveTheKey) {
  ExpectRefused(BoundText(), {}, "no-proof", "possession");
  ExpectRefused(BoundText(), {"--tls-certificate", files.Write("thief.pem", Thief().Pem())},
                "wrong-proof", "possession");
  const ToolResult result =
      Verify(BoundText(), {"--audience", kTokenAudience, "--tls-certificate", HolderPath()});
  EXPECT_EQ(result.status, 0) << result.out;
}

TEST_F(VerifyTest, ASignatureProvesTheKeyToo) {
  const std::string data = "challenge";
  std::vector<unsigned char> signature(256);
  std::size_t length = signature.size();
  EVP_MD_CTX* const context = EVP_MD_CTX_new();
  ASSERT_EQ(EVP_DigestSignInit(context, nullptr, EVP_sha256(), nullptr, Holder().key.get()), 1);
  ASSERT_EQ(EVP_DigestSign(context, signature.data(), &length,
                           reinterpret_cast<const unsigned char*>(data.data()), data.size()),
            1);
  EVP_MD_CTX_free(context);
  const Arguments proof{"--proof-signature",
                        files.Write("proof.sig", {signature.begin(), signature.begin() + length}),
                        "--proof-algorithm", "ecdsa-sha256"};
  Arguments good = proof;
  good.insert(good.end(), {"--proof-data", files.Write("proof.data", data)});
  EXPECT_EQ(VerifyForAudience(BoundText(), good).status, 0);
  Arguments bad = proof;
  bad.insert(bad.end(), {"--proof-data", files.Write("other.data", "another challenge")});
  ExpectRefused(BoundText(), bad, "wrong-proof", "possession");
}

TEST_F(VerifyTest, AProofHasALimit) {
  const std::string small = files.Write("small", "octets");
  const std::string large = files.Write("large", "");
  constexpr off_t kLimit = off_t{16} * 1024 * 1024;
  for (const auto& [data, signature] : {std::pair(large, small), std::pair(small, large)}) {
    const Arguments proof{"--proof-data", data, "--proof-signature", signature, "--json"};
    ASSERT_EQ(truncate(large.c_str(), kLimit), 0);
    EXPECT_EQ(VerifyForAudience(BoundText(), proof).Json().at("reason"), "wrong-proof");
    ASSERT_EQ(truncate(large.c_str(), kLimit + 1), 0);
    const ToolResult result = VerifyForAudience(BoundText(), proof);
    EXPECT_EQ(result.status, 4);
    ASSERT_TRUE(result.Json().contains("error")) << result.out;
    EXPECT_EQ(result.Json().at("error").at("kind"), "proof-file");
  }
}

TEST_F(VerifyTest, HasLimits) {
  ExpectRefused(AssertionText(), {"--longest-lifetime", "1h"}, "too-long-lived", "lifetime");
  EXPECT_EQ(VerifyForAudience(AssertionText(), {"--longest-lifetime", "61min"}).status, 0);
  AssertionText delegated;
  delegated.Delegate();
  ExpectRefused(delegated, {"--deepest-delegation", "1"}, "too-deeply-delegated", "delegation");
  EXPECT_EQ(VerifyForAudience(delegated, {"--deepest-delegation", "2"}).status, 0);
  ExpectRefused(AssertionText(), {"--largest-token", "1000"}, "too-large", "size");
}

TEST_F(VerifyTest, GroupsMayBeRequired) {
  EXPECT_EQ(VerifyForAudience(AssertionText(), {"--group", "EXAMPLE\\staff"}).status, 0);
  EXPECT_EQ(VerifyForAudience(AssertionText(), {"--group", "staff@EXAMPLE"}).status, 0);
  ExpectRefused(AssertionText(), {"--group", "EXAMPLE\\root"}, "not-in-group", "groups", "access");
  EXPECT_EQ(
      VerifyForAudience(AssertionText(), {"--group", "EXAMPLE\\root", "--group", "staff@example"})
          .status,
      0);
}

TEST_F(VerifyTest, TrustThatCannotBeReadIsALocalFailure) {
  const std::string token = files.WriteToken(AssertionText(), CredentialOf(Signer()));
  const std::string broken = files.Write("broken.pem", "no certificate");
  for (const Arguments& options : {Arguments{"--sts-certificate", "/nowhere/signer.pem"},
                                   Arguments{"--sts-certificate", broken},
                                   Arguments{"--sts-certificate", trust, "--crl", broken},
                                   Arguments{"--trust-for", "x", broken}}) {
    Arguments all{"verify", "--audience", kTokenAudience, "--json", token};
    all.insert(all.begin() + 1, options.begin(), options.end());
    const ToolResult result = RunInUtf8(all);
    EXPECT_EQ(result.status, 4);
    EXPECT_EQ(result.Json().at("error").at("kind"), "trust-files") << result.out;
  }
  const ToolResult proof =
      RunInUtf8(Complete({"--audience", kTokenAudience, "--tls-certificate", broken, token}));
  EXPECT_EQ(proof.status, 4);
  EXPECT_TRUE(Holds(proof.err, "cannot read " + broken)) << proof.err;
}

TEST_F(VerifyTest, ACommandLineMustMakeSense) {
  const std::string token = files.WriteToken(AssertionText(), CredentialOf(Signer()));
  for (const Arguments& options : {
           Arguments{"--sts-certificate", trust},                    // no audience
           Arguments{"--audience", "a"},                             // no trust
           Arguments{"--audience", "a", "--issuer", "b"},            // of no trust
           Arguments{"--audience", "", "--sts-certificate", trust},  //
           Arguments{"--audience", "a", "--sts-certificate", trust, "--list-signer", trust},
           Arguments{"--audience", "a", "--sts-certificate", trust, "--bearer", "maybe"},
           Arguments{"--audience", "a", "--sts-certificate", trust, "--clock-tolerance", "-1"},
           Arguments{"--audience", "a", "--sts-certificate", trust, "--longest-lifetime", "0"},
           Arguments{"--audience", "a", "--sts-certificate", trust, "--deepest-delegation", "-1"},
           Arguments{"--audience", "a", "--sts-certificate", trust, "--largest-token", "0"},
           Arguments{"--audience", "a", "--sts-certificate", trust, "--group", "staff"},
           Arguments{"--audience", "a", "--sts-certificate", trust, "--at", "noon"},
           Arguments{"--audience", "a", "--sts-certificate", trust, "--proof-data", trust},
           Arguments{"--audience", "a", "--sts-certificate", trust, "--proof-data", trust,
                     "--proof-signature", trust, "--proof-algorithm", "md5"},
           Arguments{"--audience", "a", "--sts-certificate", trust, "another"},
       }) {
    Arguments all{"verify", token};
    all.insert(all.end(), options.begin(), options.end());
    const ToolResult result = RunInUtf8(all);
    EXPECT_EQ(result.status, 2) << ::testing::PrintToString(options);
    EXPECT_EQ(result.out, "");
    EXPECT_TRUE(Holds(result.err, "\n  remedy: ")) << result.err;
  }
}

TEST_F(VerifyTest, MarksAreAsciiAndColoursMissingWhereTheyMustBe) {
  const std::string token = files.WriteToken(AssertionText(), CredentialOf(Signer()));
  const Arguments all = Complete({"--audience", kTokenAudience, token});
  const std::string ascii = RunOnTerminal(all, {{"LC_ALL", "C"}, {"NO_COLOR", "1"}}).terminal;
  EXPECT_TRUE(Holds(ascii, "+  audience ")) << ascii;
  EXPECT_TRUE(Holds(ascii, "x  confirmation ")) << ascii;
  EXPECT_TRUE(Holds(ascii, "-  possession ")) << ascii;
  EXPECT_FALSE(Holds(ascii, "\x1b"));
  const std::string coloured = RunOnTerminal(all).terminal;
  EXPECT_TRUE(Holds(coloured, "\x1b[32m✓\x1b[0m")) << coloured;
  EXPECT_TRUE(Holds(coloured, "\x1b[31m✗\x1b[0m")) << coloured;
  EXPECT_FALSE(Holds(RunInUtf8(all).out, "\x1b"));
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
