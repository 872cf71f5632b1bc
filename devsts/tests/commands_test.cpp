#include "commands.h"

#include <cctype>
#include <chrono>
#include <ctime>
#include <memory>
#include <stdexcept>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "command_line.h"
#include "devsts/server.h"
#include "raw_client.h"
#include "request_text.h"

namespace DevSts::Testing {
namespace {

using Program::Commands;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

Program::Keys KeysOf(const Server& server) {
  Program::Keys keys;
  keys.authority.certificatePem = server.CaCertificatePem();
  keys.signing.certificatePem = server.SigningCertificatePem();
  return keys;
}

// A server and its commands.
class CommandsTest : public testing::Test {
 protected:
  std::string Execute(const std::string& line) { return commands.Execute(line).line; }

  std::unique_ptr<RawClient> Post(const std::string& envelope = AliceEnvelope()) const {
    auto client = std::make_unique<RawClient>(server.HttpPort());
    client->Send(PostOf(envelope, kIssueAction));
    return client;
  }
  std::string Ask(const std::string& envelope = AliceEnvelope()) const {
    return Post(envelope)->ReadAnswer();
  }
  long StartTls() const {
    RawClient client(server.HttpsPort());
    return client.StartTls(server.CaCertificatePem(), nullptr, "localhost");
  }

  Server server;
  Commands commands{server, DemoUsers(), AssertionOptions(),
                    Program::Revocations(KeysOf(server), "")};
};

TEST_F(CommandsTest, MisbehavesUntilCleared) {
  EXPECT_EQ(Execute("misbehave fault=wst:RequestFailed \"fault-text=not \\\"now\\\"\""),
            "ok misbehaving");
  for (int i = 0; i < 2; ++i) {
    const std::string answer = Ask();
    EXPECT_THAT(answer, HasSubstr(">wst:RequestFailed<"));
    EXPECT_EQ(ElementText(answer, "faultstring"), "not &quot;now&quot;");
  }
  EXPECT_EQ(Execute("clear"), "ok cleared");
  EXPECT_THAT(Ask(), StartsWith("HTTP/1.1 200 "));
}

TEST_F(CommandsTest, MisbehavesForTheNextRequests) {
  EXPECT_EQ(Execute("misbehave next 2 http-status=503 http-reason=Busy"), "ok misbehaving next 2");
  EXPECT_THAT(Ask(), StartsWith("HTTP/1.1 503 Busy\r\n"));
  EXPECT_THAT(Ask(), StartsWith("HTTP/1.1 503 Busy\r\n"));
  EXPECT_THAT(Ask(), StartsWith("HTTP/1.1 200 "));
}

TEST_F(CommandsTest, StallsAndResumes) {
  EXPECT_EQ(Execute("stall"), "ok stalled");
  const auto client = Post();
  EXPECT_EQ(Execute("wait stalled 1"), "ok stalled=1");
  EXPECT_EQ(Execute("resume"), "ok resumed");
  EXPECT_THAT(Ask(), StartsWith("HTTP/1.1 200 "));
}

TEST_F(CommandsTest, ResumingLeavesTheMisbehaviourOfTheNextRequests) {
  EXPECT_EQ(Execute("misbehave http-status=503"), "ok misbehaving");
  EXPECT_EQ(Execute("misbehave next 1 http-status=429"), "ok misbehaving next 1");
  EXPECT_EQ(Execute("resume"), "ok resumed");
  EXPECT_THAT(Ask(), StartsWith("HTTP/1.1 429 "));
  EXPECT_THAT(Ask(), StartsWith("HTTP/1.1 200 "));
}

TEST_F(CommandsTest, RevokesTokens) {
  const std::string assertion = AssertionIn(Ask());
  const std::size_t begin = assertion.find(" ID=\"") + 5;
  const std::string id = assertion.substr(begin, assertion.find('"', begin) - begin);
  const std::string question = Envelope("", ValidateBody(assertion));
  const auto validate = [&] {
    RawClient client(server.HttpPort());
    client.Send(PostOf(question, kValidateAction));
    return client.ReadAnswer();
  };
  EXPECT_THAT(validate(), HasSubstr("/status/valid"));
  EXPECT_EQ(Execute("revoke " + id), "ok revoked " + id);
  EXPECT_THAT(validate(), HasSubstr("/status/invalid"));
  EXPECT_EQ(Execute("revoke _1"), "error no such token: _1");
}

TEST_F(CommandsTest, ChangesUsers) {
  const std::string carol = "carol@EXAMPLE.COM";
  EXPECT_THAT(Ask(IssueEnvelope(carol, "new")), HasSubstr("Invalid credentials"));
  EXPECT_EQ(Execute("add-user " + carol + " password=new group=EXAMPLE\\staff"),
            "ok added " + carol);
  EXPECT_THAT(Ask(IssueEnvelope(carol, "new")), HasSubstr("EXAMPLE\\staff"));
  EXPECT_EQ(Execute("set-password " + carol + " \"newer one\""), "ok password set");
  EXPECT_THAT(Ask(IssueEnvelope(carol, "new")), HasSubstr("Invalid credentials"));
  EXPECT_THAT(Ask(IssueEnvelope(carol, "newer one")), StartsWith("HTTP/1.1 200 "));
  EXPECT_EQ(Execute("remove-user " + carol), "ok removed " + carol);
  EXPECT_THAT(Ask(IssueEnvelope(carol, "newer one")), HasSubstr("Invalid credentials"));
  EXPECT_THAT(Ask(), StartsWith("HTTP/1.1 200 ")) << "Other users are as before";
}

TEST_F(CommandsTest, NobodyLogsInWithAnEmptyPassword) {
  Execute("add-user dave@EXAMPLE.COM given-name=Dave");
  EXPECT_THAT(Ask(IssueEnvelope("dave@EXAMPLE.COM", "")), HasSubstr("Invalid credentials"));
}

TEST_F(CommandsTest, ChangesTheCertificateOfNewConnections) {
  EXPECT_EQ(StartTls(), X509_V_OK);
  EXPECT_EQ(Execute("tls expired"), "ok tls set");
  EXPECT_EQ(StartTls(), X509_V_ERR_CERT_HAS_EXPIRED);
  EXPECT_EQ(Execute("tls"), "ok tls set");
  EXPECT_EQ(StartTls(), X509_V_OK);
}

TEST_F(CommandsTest, ChangesTheFormOfTokens) {
  EXPECT_EQ(Execute("assertion signature=rsa-sha512 digest=sha384 before-signing=/Archer/Baker/"),
            "ok assertion set");
  const std::string assertion = AssertionIn(Ask());
  EXPECT_THAT(assertion, HasSubstr("rsa-sha512"));
  EXPECT_THAT(assertion, HasSubstr("sha384\""));
  EXPECT_THAT(assertion, HasSubstr("Baker"));
  EXPECT_TRUE(VerifyXml(assertion, server.SigningCertificatePem()));
  EXPECT_EQ(Execute("assertion after-signing=/Archer/Baker/"), "ok assertion set");
  EXPECT_FALSE(VerifyXml(AssertionIn(Ask()), server.SigningCertificatePem()));
  EXPECT_EQ(Execute("assertion"), "ok assertion set");
  EXPECT_THAT(AssertionIn(Ask()), HasSubstr("rsa-sha256"));
}

TEST_F(CommandsTest, APeerAddsNoFieldsToTheLineOfItsRequest) {
  RawClient client(server.HttpPort());
  client.Send(PostOf(AliceEnvelope(), "a\" status=200 b=\"\tc"));
  EXPECT_THAT(client.ReadAnswer(), HasSubstr("Unsupported SOAPAction"));
  EXPECT_THAT(Execute("request last"),
              HasSubstr(" action=\"a? status=200 b=??c\" signature=none status=500 fault=\""));
}

TEST_F(CommandsTest, ShowsFaultTextsInUtf8) {
  const std::string text = "Fermé à 5 €";
  EXPECT_EQ(Execute("misbehave fault=wst:RequestFailed \"fault-text=" + text + "\""),
            "ok misbehaving");
  EXPECT_EQ(ElementText(Ask(), "faultstring"), text);
  EXPECT_THAT(Execute("request last"), HasSubstr(" fault=\"" + text + "\""));
}

TEST_F(CommandsTest, ShowsRequestsWithoutPasswords) {
  Ask();
  EXPECT_EQ(Execute("requests"), "ok requests=1");
  EXPECT_THAT(Execute("request last"),
              HasSubstr(" action=\"" + std::string(kIssueAction) + "\" signature=none "));
  EXPECT_THAT(Execute("request 1"), HasSubstr(" status=200"));
  EXPECT_THAT(Execute("request 1"), Not(HasSubstr("secret")));
  EXPECT_THAT(Execute("request 2"), StartsWith("error "));
  EXPECT_THAT(Execute("counters"), HasSubstr(" requests=1 "));
  EXPECT_EQ(Execute("clear-requests"), "ok cleared");
  EXPECT_EQ(Execute("requests"), "ok requests=0");
}

TEST_F(CommandsTest, WaitsForACounterOnlyAsLongAsAsked) {
  EXPECT_THAT(Execute("wait requests 1 1ms"), StartsWith("error not reached: connections=0"));
  Ask();
  EXPECT_EQ(Execute("wait requests 1 1h"), "ok requests=1");
}

TEST_F(CommandsTest, QuitsOnlyOnRequest) {
  EXPECT_FALSE(commands.Execute("counters").quits);
  EXPECT_FALSE(commands.Execute("quit now").quits);
  EXPECT_TRUE(commands.Execute("quit").quits);
}

TEST_F(CommandsTest, RefusesWrongCommands) {
  for (const char* line : {"",
                           "  ",
                           "sing",
                           "revoke",
                           "revoke a b",
                           "misbehave",
                           "misbehave next",
                           "misbehave next 2",
                           "misbehave next x close",
                           "misbehave clse",
                           "misbehave close=1",
                           "misbehave delay",
                           "misbehave delay=1",
                           "misbehave stall=here",
                           "misbehave \"close",
                           "tls wrong",
                           "tls expired=1",
                           "assertion indent=maybe",
                           "assertion signing-key=ec-p256",
                           "assertion signature=ecdsa-sha256",
                           "negotiation more-legs=-1",
                           "wait requets 1",
                           "wait requests x",
                           "request 0",
                           "request x",
                           "add-user alice password=x",
                           "add-user a@B password=",
                           "add-user a@B certificate=x",
                           "add-user a@B given-name=\x01",
                           "add-user a@B given-name=\xeb",
                           "add-user \xeb@B password=x",
                           "set-password nobody@B x",
                           "set-password alice@EXAMPLE.COM \"\"",
                           "remove-user nobody@B",
                           "revoke-certificate ca",
                           "revoke-certificate signing"}) {
    EXPECT_THAT(Execute(line), StartsWith("error ")) << line;
  }
  EXPECT_THAT(Ask(), StartsWith("HTTP/1.1 200 ")) << "A refused command changes nothing";
}

struct MisbehaviorCase {
  const char* name;
  const char* words;
  const char* inAnswer;
};

class MisbehaviorNameTest : public CommandsTest,
                            public testing::WithParamInterface<MisbehaviorCase> {};

TEST_P(MisbehaviorNameTest, ChangesTheAnswer) {
  EXPECT_THAT(Ask(), Not(HasSubstr(GetParam().inAnswer)));
  ASSERT_EQ(Execute(std::string("misbehave ") + GetParam().words), "ok misbehaving");
  const auto client = Post();
  std::string answer;
  while (answer.find(GetParam().inAnswer) == std::string::npos && client->ReadSome(answer)) {
  }
  EXPECT_THAT(answer, HasSubstr(GetParam().inAnswer));
}

INSTANTIATE_TEST_SUITE_P(
    EachAnswer, MisbehaviorNameTest,
    testing::Values(
        MisbehaviorCase{"FaultByUri", "fault={urn:any}Code", "xmlns:code=\"urn:any\">code:Code<"},
        MisbehaviorCase{"FaultByPrefix", "fault=wsse:InvalidSecurity", ">wsse:InvalidSecurity<"},
        MisbehaviorCase{"FaultWithoutNamespace", "fault=Code", "<faultcode>Code<"},
        MisbehaviorCase{"FaultText", "fault-text=why\\x21", "<faultstring>why!<"},
        MisbehaviorCase{"FaultWithoutText", "fault=Code fault-without-text",
                        "Code</faultcode></soapenv:Fault>"},
        MisbehaviorCase{"FaultStatus", "fault-status=418", "HTTP/1.1 418 "},
        MisbehaviorCase{"HttpStatus", "http-status=302", "HTTP/1.1 302 Found\r\n"},
        MisbehaviorCase{"HttpStatusWithoutName", "http-status=299", "HTTP/1.1 299 \r\n"},
        MisbehaviorCase{"HttpReason", "http-reason=Elsewhere http-status=302",
                        "HTTP/1.1 302 Elsewhere\r\n"},
        MisbehaviorCase{"HttpHeader", "\"http-header=Location: urn:x\"", "\r\nLocation: urn:x\r\n"},
        MisbehaviorCase{"HttpBody", "http-body=proxy", "\r\n\r\nproxy"},
        MisbehaviorCase{"RawAnswer", "raw-answer=\\x00\\r\\n\\t\\\\!", "\r\n\t\\!"},
        MisbehaviorCase{"RawPrefix", "\"raw-prefix=HTTP/1.1 100 Continue\\\\r\\\\n\\\\r\\\\n\"",
                        "HTTP/1.1 100 Continue\r\n\r\nHTTP/1.1 200"},
        MisbehaviorCase{"EditEnvelope", "edit-envelope=/Alice/Mallory/ edit-envelope=|Mallory|Eve|",
                        ">Eve<"},
        MisbehaviorCase{"Header", "\"header=X-Extra: yes\"", "\r\nX-Extra: yes\r\n"},
        MisbehaviorCase{"Cookie", "cookie=a=1 cookie=b=2",
                        "Set-Cookie: a=1\r\nSet-Cookie: b=2\r\n"},
        MisbehaviorCase{"PadHeaders", "pad-headers=5000", "\r\nX-Padding-1: "},
        MisbehaviorCase{"PadBody", "pad-body=20", ">                    "},
        MisbehaviorCase{"Chunks", "chunks=7,5", "\r\n\r\n7\r\n"},
        MisbehaviorCase{"Close", "close", "\r\nConnection: close\r\n"}),
    [](const auto& test) { return std::string(test.param.name); });

TEST_F(CommandsTest, HasAWrongClock) {
  EXPECT_EQ(Execute("misbehave clock=+1h"), "ok misbehaving");
  EXPECT_THAT(Ask(), HasSubstr("The Timestamp has expired"));
  EXPECT_EQ(Execute("misbehave clock=-1h"), "ok misbehaving");
  EXPECT_THAT(Ask(), HasSubstr("The Timestamp is in the future"));
  // Within the skew that the service allows.
  EXPECT_EQ(Execute("misbehave clock=-50s"), "ok misbehaving");
  const std::string answer = Ask();
  EXPECT_THAT(answer, HasSubstr(" IssueInstant=\""));
  EXPECT_LT(answer.substr(answer.find(" IssueInstant=") + 15, 19), TimeFromNow(-40).substr(0, 19));
  std::tm date{};
  ASSERT_NE(
      strptime(answer.c_str() + answer.find("\r\nDate: ") + 8, "%a, %d %b %Y %H:%M:%S", &date),
      nullptr);
  EXPECT_LT(timegm(&date), std::time(nullptr) - 40);
  EXPECT_THAT(Execute("misbehave clock=10m"), HasSubstr("'10m' is not a sign and a time"));
}

TEST_F(CommandsTest, OmitsTheDateByName) {
  EXPECT_THAT(Ask(), HasSubstr("\r\nDate: "));
  Execute("misbehave without-date");
  EXPECT_THAT(Ask(), Not(HasSubstr("\r\nDate: ")));
}

TEST_F(CommandsTest, EndsConnectionsByName) {
  Execute("misbehave close-unannounced");
  const auto closed = Post();
  EXPECT_THAT(closed->ReadToEnd(), Not(HasSubstr("Connection: close")));
  Execute("misbehave cut-off=40/reset");
  const auto cut = Post();
  cut->ReadToEnd();
  EXPECT_EQ(cut->HowItEnded(), Ending::Reset);
  Execute("misbehave cut-off=40");
  EXPECT_EQ(Post()->ReadToEnd().size(), 40U);
}

TEST_F(CommandsTest, SlowsAnswersByName) {
  Execute("misbehave drip=100/1ms delay=20ms");
  const auto begin = std::chrono::steady_clock::now();
  EXPECT_THAT(Ask(), StartsWith("HTTP/1.1 200 "));
  EXPECT_GE(std::chrono::steady_clock::now() - begin, std::chrono::milliseconds(40));
}

TEST_F(CommandsTest, StallsAtEachStageByName) {
  unsigned stalls = 0;
  for (const char* stage :
       {"before-handshake", "before-request", "before-answer", "after-headers", "in-body"}) {
    ASSERT_EQ(Execute(std::string("misbehave next 1 stall=") + stage), "ok misbehaving next 1");
    const auto client = Post();
    const std::string count = std::to_string(++stalls);
    EXPECT_EQ(Execute("wait stalls " + count), "ok stalls=" + count) << stage;
    EXPECT_THAT(Ask(), StartsWith("HTTP/1.1 200 ")) << stage;
  }
}

struct TlsCase {
  const char* name;
  long verdict;
};

class TlsNameTest : public CommandsTest, public testing::WithParamInterface<TlsCase> {};

TEST_P(TlsNameTest, ChangesTheHandshake) {
  ASSERT_EQ(Execute(std::string("tls ") + GetParam().name), "ok tls set");
  EXPECT_EQ(StartTls(), GetParam().verdict);
}

INSTANTIATE_TEST_SUITE_P(
    Each, TlsNameTest,
    testing::Values(TlsCase{"valid", X509_V_OK}, TlsCase{"through-intermediate", X509_V_OK},
                    TlsCase{"missing-intermediate", X509_V_ERR_UNABLE_TO_GET_ISSUER_CERT_LOCALLY},
                    TlsCase{"expired", X509_V_ERR_CERT_HAS_EXPIRED},
                    TlsCase{"not-yet-valid", X509_V_ERR_CERT_NOT_YET_VALID},
                    TlsCase{"self-signed", X509_V_ERR_DEPTH_ZERO_SELF_SIGNED_CERT},
                    TlsCase{"wrong-host", X509_V_ERR_HOSTNAME_MISMATCH},
                    TlsCase{"name-only-in-common-name", X509_V_ERR_HOSTNAME_MISMATCH},
                    TlsCase{"address-as-dns-name", X509_V_ERR_HOSTNAME_MISMATCH},
                    TlsCase{"nul-in-name", X509_V_ERR_HOSTNAME_MISMATCH},
                    TlsCase{"name=localhost", X509_V_OK},
                    TlsCase{"name=elsewhere.example", X509_V_ERR_HOSTNAME_MISMATCH},
                    TlsCase{"address=127.0.0.1", X509_V_ERR_HOSTNAME_MISMATCH},
                    TlsCase{"modern", X509_V_OK}, TlsCase{"tls12-only", X509_V_OK},
                    TlsCase{"tls11-only", -1}, TlsCase{"anonymous-suites", -1},
                    TlsCase{"no-resumption", X509_V_OK}),
    [](const auto& test) {
      std::string name = test.param.name;
      std::erase_if(name, [](char character) { return std::isalnum(character) == 0; });
      return name;
    });

TEST_F(CommandsTest, SpeaksOnlyTheNamedVersion) {
  Execute("tls tls12-only");
  RawClient client(server.HttpsPort());
  EXPECT_EQ(client.StartTls(server.CaCertificatePem()), X509_V_OK);
  EXPECT_STREQ(SSL_get_version(client.Tls()), "TLSv1.2");
}

TEST_F(CommandsTest, RequiresClientCertificatesByName) {
  Execute("tls client-certificate tls12-only");
  EXPECT_EQ(StartTls(), -1);
  const Credential machine = server.MakeClientCredential("machine");
  RawClient client(server.HttpsPort());
  client.UseClientCredential(machine.certificatePem, machine.privateKeyPem);
  EXPECT_EQ(client.StartTls(server.CaCertificatePem()), X509_V_OK);
}

struct AssertionCase {
  const char* name;
  const char* words;
  const char* with;     // in the answer
  const char* without;  // not in the answer
};

class AssertionNameTest : public CommandsTest, public testing::WithParamInterface<AssertionCase> {};

TEST_P(AssertionNameTest, ChangesTheToken) {
  ASSERT_EQ(Execute(std::string("assertion ") + GetParam().words), "ok assertion set");
  const std::string answer = Ask();
  EXPECT_THAT(answer, HasSubstr(GetParam().with));
  EXPECT_THAT(answer, Not(HasSubstr(GetParam().without)));
}

INSTANTIATE_TEST_SUITE_P(
    Each, AssertionNameTest,
    testing::Values(
        AssertionCase{"Sha1", "signature=rsa-sha1 digest=sha1", "#rsa-sha1", "#rsa-sha256"},
        AssertionCase{"Pss", "signature=rsa-pss-sha256", "#sha256-rsa-MGF1", "#rsa-sha256"},
        AssertionCase{"Comments", "canonical-form=exclusive-with-comments", "exc-c14n#WithComments",
                      "xml-c14n-2001"},
        AssertionCase{"Inclusive", "canonical-form=inclusive", "REC-xml-c14n-20010315",
                      "<ec:InclusiveNamespaces"},
        AssertionCase{"NoPrefixes", "prefixes=none", "xml-exc-c14n#", "PrefixList=\"del"},
        AssertionCase{"Prefixes", "prefixes=del,xs", "PrefixList=\"del xs\"",
                      "PrefixList=\"del rsa"},
        AssertionCase{"KeyValue", "key-info=key", "RSAKeyValue", "X509Certificate"},
        AssertionCase{"NoKeyInfo", "key-info=none", "SignatureValue", "X509Certificate"},
        AssertionCase{"SignedId",
                      "\"before-signing=|<saml2:AuthnStatement|<saml2:AuthnStatement ID='_x'|\" "
                      "signed-id=_x",
                      "<ds:Reference URI=\"#_x\"", "Issuer><ds:Signature"},
        AssertionCase{"InheritNamespaces", "inherit-namespaces=yes",
                      "<saml2:Assertion ID=", "<saml2:Assertion xmlns:saml2="},
        AssertionCase{"Indent", "indent=yes", ">\n", "><saml2:Subject"},
        AssertionCase{"IssuerFormat", "issuer-format=no", "Issuer>", "Issuer Format"},
        AssertionCase{"AttributeTypes", "attribute-types=no", "AttributeValue>", "xs:string\">"},
        AssertionCase{"RenewCount", "renew-count=3", "Count=\"3\"", "Count=\"0\""},
        AssertionCase{"ProxyCount", "proxy-count=4", "Count=\"4\"", "Count=\"0\""},
        AssertionCase{"Postdatable", "postdatable=yes", "Postdatable=\"true\"",
                      "Postdatable=\"false\""},
        AssertionCase{"RenewExpired", "renew-expired=yes", "RenewExpired=\"true\"",
                      "RenewExpired=\"false\""}),
    [](const auto& test) { return std::string(test.param.name); });

TEST_F(CommandsTest, ChangesTheTimesOfTokens) {
  const auto time = [](const std::string& text, const std::string& name) {
    return text.substr(text.find(name + "=\"") + name.size() + 2, 10);
  };
  Execute("assertion not-before-offset=400d max-lifetime=1s");
  const std::string assertion = AssertionIn(Ask());
  EXPECT_LT(time(assertion, "NotBefore"), TimeFromNow(-399L * 86400));
  EXPECT_LE(time(assertion, "NotOnOrAfter"), TimeFromNow(2));
}

TEST_F(CommandsTest, SignsOtherThingsByName) {
  Execute("assertion reference-uri=#other");
  EXPECT_THAT(Ask(), HasSubstr("xmlsec1 cannot sign")) << "There is no such element";
}

TEST(CommandLineTest, KeepsTheWordsOfALine) {
  const std::vector<std::string> words{"a", "", "two words", "EXAMPLE\\staff", "\"", "x=\\\\ \\\""};
  EXPECT_EQ(Program::WordsOf(Program::LineOf(words)), words);
  EXPECT_THAT(Program::WordsOf("  a  \"b\\\\\" c\\d"), ElementsAre("a", "b\\", "c\\d"));
  EXPECT_THROW(Program::WordsOf("a \"b"), std::invalid_argument);
  EXPECT_THROW(Program::WordsOf("\"a\"b"), std::invalid_argument);
  EXPECT_THROW(Program::LineOf({"a\nquit"}), std::invalid_argument);
}

}  // namespace
}  // namespace DevSts::Testing
