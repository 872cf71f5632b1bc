// The exceptions that a caller receives when the service refuses holder-of-key operations.
#include <chrono>
#include <memory>
#include <optional>
#include <string>
#include <typeindex>
#include <typeinfo>
#include <utility>

#include <gmock/gmock.h>

#include <devsts/xml_security.h>

#include "integration/holder_of_key_fixture.h"
#include "integration/operation.h"
#include "integration/text_edits.h"

namespace SsoClient::Testing {
namespace {

using std::chrono::seconds;
using testing::StartsWith;

class HolderOfKeyFaultTest : public HolderOfKeyTest {
 protected:
  static void ExpectFailure(const Outcome& outcome, std::type_index errorClass,
                            const std::string& message) {
    EXPECT_EQ(outcome.errorClass, errorClass) << outcome.errorClass.name();
    EXPECT_EQ(outcome.message, message);
    EXPECT_EQ(outcome.token, nullptr);
  }
  /// Expects that the service gives this reason in its fault, and that the exception contains it.
  static void ExpectRejected(const Outcome& outcome, const std::string& fault) {
    ExpectFailure(outcome, typeid(InvalidCredentialsException), "Authentication failed: " + fault);
  }
  static void ExpectUnexpectedFault(const Outcome& outcome, const std::string& code) {
    ExpectFailure(outcome, typeid(SsoException),
                  "Unexpected SOAP fault: " + code + "; request failed.");
  }
  static Outcome Present(Operation operation, std::shared_ptr<const SamlToken> token,
                         const DevSts::Credential& credential = Holder()) {
    Arguments arguments;
    arguments.token = std::move(token);
    return CallNow(operation, *HolderService(credential), arguments);
  }
  static std::shared_ptr<const SamlToken> Forged(const SamlToken& token) {
    std::string xml = token.Xml();
    const auto at = xml.find(">alice@");
    EXPECT_NE(at, std::string::npos);
    xml.replace(at, 7, ">carol@");
    return CreateSamlToken(xml);
  }
};

TEST_F(HolderOfKeyFaultTest, UnknownCertificateIsRefused) {
  ExpectRejected(CallNow(Operation::Certificate, *HolderService(Stranger()), {}),
                 "The certificate belongs to no user");
}

TEST_F(HolderOfKeyFaultTest, ProvenKeyDoesNotReplaceThePassword) {
  Arguments arguments;
  arguments.password = "wrong-secret";
  ExpectRejected(CallNow(Operation::Password, *HolderService(), arguments), "Invalid credentials");
  arguments.userName = "nobody@EXAMPLE.COM";
  ExpectRejected(CallNow(Operation::Password, *HolderService(), arguments), "Invalid credentials");
  arguments.userName = "expired@EXAMPLE.COM";
  arguments.password = "expired-secret";
  ExpectFailure(CallNow(Operation::Password, *HolderService(), arguments),
                typeid(PasswordExpiredException),
                "Authentication failed: Password of the user logging on is expired. :: "
                "expired@EXAMPLE.COM");
}

struct PresentedCase {
  Operation operation;
  /// The name of the presented token in the service's faults.
  const char* place;
};

class PresentedTokenFaultTest : public HolderOfKeyFaultTest,
                                public testing::WithParamInterface<PresentedCase> {
 protected:
  static Operation Presenting() { return GetParam().operation; }
  static std::string Place() { return GetParam().place; }
  static void ExpectForged(const Outcome& outcome) {
    ExpectRejected(outcome, Sts().LastRequest().answeredFault);
    EXPECT_THAT(outcome.message,
                StartsWith("Authentication failed: " + Place() + "'s signature does not verify: "));
  }
};

TEST_P(PresentedTokenFaultTest, RevokedTokenIsRefused) {
  const auto token = AcquireBound();
  ASSERT_TRUE(Present(Presenting(), token).IsSuccess());
  ASSERT_TRUE(Sts().Revoke(token->Id()));
  ExpectRejected(Present(Presenting(), token), Place() + " was revoked");
}

TEST_P(PresentedTokenFaultTest, ForgedTokenIsRefused) {
  ExpectForged(Present(Presenting(), Forged(*AcquireBound())));
}

TEST_P(PresentedTokenFaultTest, TokenThatTheServiceForgotIsRefused) {
  DevSts::ServerOptions options;
  options.issuedTokenLimit = 1;
  const DevSts::Server forgetful(options);
  const auto service = MakeHolderService(forgetful, forgetful.HttpsUrl(), Holder());
  Arguments arguments;
  arguments.token = service->AcquireToken(kUser, kPassword, RenewableAndDelegable());
  service->AcquireToken(kUser, kPassword, TenMinutes());
  ExpectRejected(CallNow(Presenting(), *service, arguments), Place() + " is unknown");
}

TEST_P(PresentedTokenFaultTest, TokenSignedByAStrangerIsRefused) {
  std::string xml = AcquireBound()->Xml();
  EraseSignature(xml);
  const DevSts::Credential stranger = Sts().StrangerCredential();
  xml = DevSts::SignXml(xml, stranger.privateKeyPem, stranger.certificatePem,
                        DevSts::AssertionOptions::DefaultSigning());
  ExpectForged(Present(Presenting(), CreateSamlToken(xml)));
}

INSTANTIATE_TEST_SUITE_P(Operations, PresentedTokenFaultTest,
                         testing::Values(PresentedCase{Operation::Token, "The presented token"},
                                         PresentedCase{Operation::Renew, "The RenewTarget"}),
                         [](const auto& tested) { return NameOf(tested.param.operation); });

TEST_F(HolderOfKeyFaultTest, ExpiredTokenIsRefused) {
  Sts().SetAssertionOptions(ValidBetween(seconds(-100), seconds(-10)));
  const auto token = AcquireBound();
  ExpectRejected(Present(Operation::Token, token), "The presented token has expired");
  ExpectUnexpectedFault(Present(Operation::Renew, token), "wst:UnableToRenew");
}

TEST_F(HolderOfKeyFaultTest, TokenThatHasNotBegunIsRefused) {
  Sts().SetAssertionOptions(ValidBetween(seconds(100), seconds(200)));
  const auto token = AcquireBound();
  ExpectRejected(Present(Operation::Token, token), "The presented token is not yet valid");
  ExpectUnexpectedFault(Present(Operation::Renew, token), "wst:UnableToRenew");
}

TEST_F(HolderOfKeyFaultTest, KeyOtherThanTheTokensIsRefused) {
  const auto token = AcquireBound();
  // The token names the verification key, but the request is signed with another one.
  ExpectUnexpectedFault(Present(Operation::Token, token, Stranger()), "wsse:FailedCheck");
  ExpectRejected(Present(Operation::Renew, token, Stranger()),
                 "The request is not signed by the key of the RenewTarget");
}

TEST_F(HolderOfKeyFaultTest, BearerTokenProvesNothing) {
  ExpectRejected(Present(Operation::Token, Acquire()),
                 "The presented token is not a holder-of-key token");
}

TEST_F(HolderOfKeyFaultTest, RevokedActAsTokenIsRefused) {
  TokenSpec delegable = Bearer();
  delegable.delegable = true;
  Arguments arguments;
  arguments.spec.actAsToken = Acquire(delegable);
  arguments.token = AcquireBound();
  ASSERT_TRUE(Sts().Revoke((*arguments.spec.actAsToken)->Id()));
  for (const Operation operation : {Operation::Certificate, Operation::Token}) {
    ExpectRejected(CallNow(operation, *HolderService(), arguments), "The ActAs token was revoked");
  }
}

TEST_F(HolderOfKeyFaultTest, ForgedOrExpiredActAsTokenIsRefused) {
  TokenSpec delegable = Bearer();
  delegable.delegable = true;
  const auto forged = Forged(*Acquire(delegable));
  Sts().SetAssertionOptions(ValidBetween(seconds(-100), seconds(-10)));
  const auto expired = Acquire(delegable);
  Sts().SetAssertionOptions({});
  Arguments arguments;
  arguments.token = AcquireBound();
  for (const Operation operation : {Operation::Certificate, Operation::Token}) {
    arguments.spec.actAsToken = expired;
    ExpectRejected(CallNow(operation, *HolderService(), arguments), "The ActAs token has expired");
    arguments.spec.actAsToken = forged;
    const Outcome outcome = CallNow(operation, *HolderService(), arguments);
    ExpectRejected(outcome, Sts().LastRequest().answeredFault);
    EXPECT_THAT(outcome.message,
                StartsWith("Authentication failed: The ActAs token's signature does not verify: "));
  }
}

TEST_F(HolderOfKeyFaultTest, EmptyActAsTokenIsRefusedBeforeAnythingIsSent) {
  Arguments arguments;
  arguments.token = AcquireBound();
  arguments.spec.actAsToken = std::shared_ptr<const SamlToken>();
  Sts().ClearRequests();
  for (const Operation operation :
       {Operation::Password, Operation::Certificate, Operation::Token}) {
    ExpectFailure(CallNow(operation, *HolderService(), arguments),
                  typeid(Tarnik::InvalidArgumentException),
                  "TokenSpec::actAsToken is set, but holds no token");
  }
  EXPECT_TRUE(Sts().Requests().empty());
}

TEST_F(HolderOfKeyFaultTest, TokenThatIsNotDelegableIsNotDelegated) {
  Arguments arguments;
  arguments.token = AcquireBound(TenMinutes());
  arguments.spec.delegateTo = std::string("bob@EXAMPLE.COM");
  ExpectUnexpectedFault(CallNow(Operation::Token, *HolderService(), arguments),
                        "wst:InvalidRequest");
}

/// A fault of any kind, returned to each operation.
struct FaultCase {
  const char* name;
  const char* codeNamespace;
  const char* codeName;
  const char* faultString;
  std::type_index errorClass;
  const char* message;
};

class AnyFaultTest : public HolderOfKeyFaultTest, public testing::WithParamInterface<FaultCase> {};

TEST_P(AnyFaultTest, IsTheSameExceptionFromEveryOperation) {
  Arguments arguments;
  arguments.token = AcquireBound();
  DevSts::Misbehavior misbehavior;
  misbehavior.fault = DevSts::FaultAnswer{GetParam().codeNamespace, GetParam().codeName,
                                          GetParam().faultString, false, 500};
  Sts().SetMisbehavior(misbehavior);
  for (const Operation operation : kOperations) {
    SCOPED_TRACE(NameOf(operation));
    const Outcome outcome = CallNow(operation, *HolderService(), arguments);
    ExpectFailure(outcome, GetParam().errorClass, GetParam().message);
    EXPECT_EQ(outcome.verdict, std::nullopt);
  }
}

INSTANTIATE_TEST_SUITE_P(
    Faults, AnyFaultTest,
    testing::Values(
        FaultCase{"FailedAuthentication", kTrust, "FailedAuthentication", "no",
                  typeid(InvalidCredentialsException), "Authentication failed: no"},
        FaultCase{"ExpiredPassword", kTrust, "FailedAuthentication",
                  "Password of the user logging on is expired. :: x",
                  typeid(PasswordExpiredException),
                  "Authentication failed: Password of the user logging on is expired. :: x"},
        FaultCase{"InvalidSecurityTokenOfTrust", kTrust, "InvalidSecurityToken", "bad",
                  typeid(InvalidCredentialsException), "Authentication failed: bad"},
        FaultCase{"InvalidSecurityTokenOfSecurity", kSecext, "InvalidSecurityToken", "bad",
                  typeid(InvalidCredentialsException), "Authentication failed: bad"},
        FaultCase{"RequestFailed", kTrust, "RequestFailed", "hidden", typeid(SsoException),
                  "Unexpected SOAP fault: wst:RequestFailed; request failed."},
        FaultCase{"FailedCheck", kSecext, "FailedCheck", "hidden", typeid(SsoException),
                  "Unexpected SOAP fault: wsse:FailedCheck; request failed."}),
    [](const auto& tested) { return tested.param.name; });

}  // namespace
}  // namespace SsoClient::Testing
