#include <cstddef>
#include <set>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "integration/sts_fixture.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;

class AcquireTokenTest : public StsTest {};

long Seconds(const Tarnik::System::DateTime& from, const Tarnik::System::DateTime& to) {
  return (to.GetUtcTime() - from.GetUtcTime()) / 1'000'000;
}

TEST_F(AcquireTokenTest, GivesAValidatedBearerTokenOverTls) {
  const auto token = Acquire();
  ASSERT_NE(token, nullptr);
  EXPECT_EQ(token->Subject(), (PrincipalId{"alice", "EXAMPLE.COM"}));
  EXPECT_EQ(token->ConfirmationType(), BEARER);
  EXPECT_EQ(token->HolderOfKeyCertificate(), nullptr);
  EXPECT_EQ(token->Issuer(), "https://sts.example.com/STS");
  EXPECT_EQ(token->Id().front(), '_');
  EXPECT_EQ(Seconds(token->StartTime(), token->ExpirationTime()), 600);
  EXPECT_EQ(Seconds(token->ExpirationTime(), token->ExpirationTimeWithTolerance()), 600);
  EXPECT_FALSE(token->IsRenewable());
  EXPECT_FALSE(token->IsDelegable());
  EXPECT_FALSE(token->IsSolution());
}

TEST_F(AcquireTokenTest, WorksOverPlainHttpWithoutTlsTrust) {
  SecurityTokenServiceConfig config;
  config.url = Sts().HttpUrl();
  config.tokenFactory = CreateSamlTokenFactory(TrustSigner(Sts().SigningCertificatePem()).get());
  const auto token =
      CreateSecurityTokenService(config)->AcquireToken(kUser, kPassword, TenMinutes());
  EXPECT_EQ(token->Subject().name, "alice");
}

TEST_F(AcquireTokenTest, TokenHasNamesAndGroupsOfTheSubject) {
  const auto token = Acquire();
  SubjectNames names;
  token->GetSubjectNames(names);
  const DevSts::User user = DevSts::DemoUsers().at(kUser);
  EXPECT_EQ(names.givenName, user.givenName);
  EXPECT_EQ(names.surname, user.surname);
  std::vector<PrincipalId> groups;
  token->GetGroups(groups);
  EXPECT_THAT(groups,
              ElementsAre(PrincipalId{"staff", "EXAMPLE"}, PrincipalId{"admins", "EXAMPLE"}));
}

TEST_F(AcquireTokenTest, SolutionUserIsMarked) {
  const auto token = Service()->AcquireToken("machine@EXAMPLE.COM", "machine-secret", TenMinutes());
  EXPECT_TRUE(token->IsSolution());
}

TEST_F(AcquireTokenTest, SpecReachesTheToken) {
  TokenSpec spec = TenMinutes();
  spec.renewable = true;
  spec.delegable = true;
  spec.audienceRestriction = {"https://b.example", "https://a.example"};
  spec.advice = {{"urn:source", {{"urn:attribute", {"one", "", "two"}}, {"urn:empty", {}}}},
                 {"", {}}};
  const auto token = Acquire(spec);
  EXPECT_TRUE(token->IsRenewable());
  EXPECT_TRUE(token->IsDelegable());
  std::set<std::string> audiences;
  token->GetAudiences(audiences);
  EXPECT_THAT(audiences, ElementsAre("https://a.example", "https://b.example"));
  std::vector<Advice> advice;
  token->GetAdvice(advice);
  ASSERT_EQ(advice.size(), 2U);
  EXPECT_EQ(advice[0].source, "urn:source");
  ASSERT_EQ(advice[0].attributes.size(), 2U);
  EXPECT_EQ(advice[0].attributes[0].name, "urn:attribute");
  EXPECT_THAT(advice[0].attributes[0].values, ElementsAre("one", "", "two"));
  EXPECT_EQ(advice[0].attributes[1].name, "urn:empty");
  EXPECT_THAT(advice[0].attributes[1].values, ElementsAre());
  EXPECT_EQ(advice[1].source, "");
  EXPECT_THAT(advice[1].attributes, ElementsAre());
}

TEST_F(AcquireTokenTest, DelegationIsReadBackAsAChain) {
  TokenSpec spec = TenMinutes();
  spec.delegateTo = std::string("machine@EXAMPLE.COM");
  const auto token = Acquire(spec);
  std::vector<Delegate> chain;
  token->GetDelegationChain(chain);
  ASSERT_EQ(chain.size(), 1U);
  EXPECT_EQ(chain[0].delegate, (PrincipalId{"machine", "EXAMPLE.COM"}));
}

TEST_F(AcquireTokenTest, TokenIsAcceptedAsActAsToken) {
  TokenSpec delegable = TenMinutes();
  delegable.delegable = true;
  TokenSpec actAs = TenMinutes();
  actAs.actAsToken = Acquire(delegable);
  Sts().ClearRequests();
  const auto token = Service()->AcquireToken("machine@EXAMPLE.COM", "machine-secret", actAs);
  EXPECT_EQ(token->Subject().name, "alice");
  std::vector<Delegate> chain;
  token->GetDelegationChain(chain);
  ASSERT_FALSE(chain.empty());
  EXPECT_EQ(chain.back().delegate.name, "machine");
}

TEST_F(AcquireTokenTest, MarkupAndNonAsciiLettersReachTheServiceUnchanged) {
  const std::string password = "p<&>\"']]>\t\xC3\xA4\xF0\x9F\x94\x91 ";
  DevSts::Users users;
  users["j\xC3\xBCrgen&co@example.com"].password = password;
  Sts().SetUsers(users);
  const auto token =
      Service()->AcquireToken("j\xC3\xBCrgen&co@example.com", password, TenMinutes());
  EXPECT_EQ(token->Subject().name, "j\xC3\xBCrgen&co");
}

TEST_F(AcquireTokenTest, RequestIsTheExpectedPost) {
  Acquire();
  const auto request = Sts().LastRequest();
  EXPECT_EQ(request.method, "POST");
  EXPECT_EQ(request.target, "/sts");
  EXPECT_EQ(request.Header("Content-Type"), "text/xml");
  EXPECT_EQ(request.Header("SOAPAction"),
            "\"http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue\"");
  EXPECT_EQ(request.HeaderCount("Accept-Encoding"), 0U);
  EXPECT_THAT(request.body, HasSubstr("/Bearer</wst:KeyType>"));
}

TEST_F(AcquireTokenTest, PathAndQueryOfTheUrlAreTheRequestTarget) {
  SecurityTokenServiceConfig config;
  config.url = Sts().HttpsUrl("/path/to/sts?tenant=one");
  const auto sslContext = TrustCa(Sts());
  config.sslContext = sslContext.get();
  config.tokenFactory = CreateSamlTokenFactory(TrustSigner(Sts().SigningCertificatePem()).get());
  CreateSecurityTokenService(config)->AcquireToken(kUser, kPassword, TenMinutes());
  EXPECT_EQ(Sts().LastRequest().target, "/path/to/sts?tenant=one");
}

TEST_F(AcquireTokenTest, SslPeerNameReplacesTheHost) {
  SecurityTokenServiceConfig config;
  const auto sslContext = TrustCa(Sts());
  config.url = Sts().HttpsUrl();
  config.sslPeerName = "localhost";
  config.sslContext = sslContext.get();
  config.tokenFactory = CreateSamlTokenFactory(TrustSigner(Sts().SigningCertificatePem()).get());
  EXPECT_NE(CreateSecurityTokenService(config)->AcquireToken(kUser, kPassword, TenMinutes()),
            nullptr);
}

struct SigningCase {
  const char* name;
  DevSts::SignatureAlgorithm signature;
  DevSts::DigestAlgorithm digest;
  DevSts::KeyType key;
};

class SigningAlgorithmTest : public testing::TestWithParam<SigningCase> {};

TEST_P(SigningAlgorithmTest, TokenIsAccepted) {
  DevSts::ServerOptions options;
  options.assertion.signing.signature = GetParam().signature;
  options.assertion.signing.digest = GetParam().digest;
  options.assertion.signingKey = GetParam().key;
  const DevSts::Server server(options);
  const auto token =
      MakeService(server, server.HttpsUrl())->AcquireToken(kUser, kPassword, TenMinutes());
  EXPECT_EQ(token->Subject().name, "alice");
}

using DevSts::DigestAlgorithm;
using DevSts::KeyType;
using DevSts::SignatureAlgorithm;

INSTANTIATE_TEST_SUITE_P(Algorithms, SigningAlgorithmTest,
                         testing::Values(SigningCase{"Rsa256", SignatureAlgorithm::RsaSha256,
                                                     DigestAlgorithm::Sha256, KeyType::Rsa2048},
                                         SigningCase{"Rsa384", SignatureAlgorithm::RsaSha384,
                                                     DigestAlgorithm::Sha384, KeyType::Rsa2048},
                                         SigningCase{"Rsa512", SignatureAlgorithm::RsaSha512,
                                                     DigestAlgorithm::Sha512, KeyType::Rsa3072},
                                         SigningCase{"Pss256", SignatureAlgorithm::RsaPssSha256,
                                                     DigestAlgorithm::Sha256, KeyType::Rsa2048},
                                         SigningCase{"Ecdsa256", SignatureAlgorithm::EcdsaSha256,
                                                     DigestAlgorithm::Sha256, KeyType::EcP256},
                                         SigningCase{"Ecdsa384", SignatureAlgorithm::EcdsaSha384,
                                                     DigestAlgorithm::Sha384, KeyType::EcP384}),
                         [](const auto& tested) { return tested.param.name; });

class AnswerShapeTest : public StsTest {};

TEST_F(AnswerShapeTest, NamespacesInheritedFromTheEnvelopeKeepTheSignature) {
  DevSts::AssertionOptions options;
  options.inheritNamespaces = true;
  Sts().SetAssertionOptions(options);
  EXPECT_EQ(Acquire()->Subject().name, "alice");
}

TEST_F(AnswerShapeTest, IndentedAssertionIsAccepted) {
  DevSts::AssertionOptions options;
  options.indent = true;
  Sts().SetAssertionOptions(options);
  EXPECT_EQ(Acquire()->Subject().name, "alice");
}

TEST_F(AnswerShapeTest, InclusiveCanonicalisationIsAccepted) {
  DevSts::AssertionOptions options;
  options.signing.canonicalization = DevSts::CanonicalMode::Inclusive;
  options.signing.inclusivePrefixes.clear();
  Sts().SetAssertionOptions(options);
  EXPECT_EQ(Acquire()->Subject().name, "alice");
}

TEST_F(AnswerShapeTest, SignatureWithoutKeyInfoIsVerifiedWithTheOneTrustedKey) {
  DevSts::AssertionOptions options;
  options.signing.keyInfo = DevSts::KeyInfoContent::None;
  Sts().SetAssertionOptions(options);
  EXPECT_EQ(Acquire()->Subject().name, "alice");
}

TEST_F(AnswerShapeTest, ChunkedAnswersOfAnyChunkSizeAreAccepted) {
  for (const std::size_t size : {std::size_t{1}, std::size_t{7}, std::size_t{4096}}) {
    DevSts::Misbehavior chunks;
    chunks.chunkSizes = {size};
    Sts().MisbehaveNext(chunks);
    EXPECT_EQ(Acquire()->Subject().name, "alice") << size;
  }
}

}  // namespace
}  // namespace SsoClient::Testing
