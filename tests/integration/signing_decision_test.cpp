// What each operation signs and requests, checked in the octets that the service receives.
#include <string>
#include <typeindex>
#include <typeinfo>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include "integration/holder_of_key_fixture.h"
#include "integration/operation.h"
#include "integration/wire_request.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAreArray;
using testing::IsEmpty;

using DevSts::RequestSignature;
using Names = std::vector<std::string>;

constexpr char kProof[] = "holderOfKeyProofSignature";

/// The properties of the received request, or the reason why none is sent.
struct Expected {
  Names securityEntries;
  std::string keyType;
  std::string useKey;
  /// The class of the local failure; `void` if the request is sent.
  std::type_index failure = typeid(void);
  std::string message = {};
};

const Names kPlain = {"Timestamp"};
const Names kWithPassword = {"Timestamp", "UsernameToken"};
const Names kSignedPassword = {"Timestamp", "UsernameToken", "BinarySecurityToken", "Signature"};
const Names kByCertificate = {"Timestamp", "BinarySecurityToken", "Signature"};
const Names kByToken = {"Timestamp", "Assertion", "Signature"};

Expected Refused(std::type_index failure, std::string message) {
  return {{}, "", "", failure, std::move(message)};
}

Expected WithoutKey(const std::string& operation) {
  return Refused(typeid(Tarnik::InvalidStateException),
                 "No HolderOfKeyConfig provided. Unable to " + operation);
}

struct Cell {
  const char* name;
  Operation operation;
  bool hasKey;
  /// The confirmation in the spec or, for operations without a spec, of the presented token.
  bool isBearer;
  bool actsAs;
  Expected expected;
};

class SigningDecisionTest : public HolderOfKeyTest, public testing::WithParamInterface<Cell> {
 protected:
  static Arguments ArgumentsOf(const Cell& cell) {
    Arguments arguments;
    arguments.userName = kMachine;
    arguments.password = kMachinePassword;
    arguments.spec.confirmation = cell.isBearer ? CONFIRMATION_BEARER : CONFIRMATION_DEFAULT;
    if (cell.actsAs) {
      TokenSpec delegable = TenMinutes();
      delegable.delegable = true;
      arguments.spec.actAsToken = Acquire(delegable);
    }
    const bool presentsBearer = cell.isBearer && cell.operation != Operation::Token;
    arguments.token = presentsBearer ? Acquire() : AcquireBound();
    return arguments;
  }
};

// The service refuses a request for a bound token that does not prove the key: requests by password
// are not signed if the spec has an act-as token.
bool IsRefusedByTheService(const Cell& cell) {
  return cell.operation == Operation::Password && cell.expected.keyType == "PublicKey" &&
         cell.actsAs;
}

void ExpectSigned(const Names& securityEntries, const DevSts::ReceivedRequest& received,
                  const WireRequest& wire) {
  if (securityEntries.back() != "Signature") {
    EXPECT_EQ(wire.keyReference, "");
    EXPECT_EQ(received.signature, RequestSignature::None);
    return;
  }
  const bool byToken = securityEntries == kByToken;
  EXPECT_EQ(wire.keyReference, byToken ? "KeyIdentifier" : "Reference");
  EXPECT_EQ(received.signature,
            byToken ? RequestSignature::ByToken : RequestSignature::ByCertificate);
}

void ExpectOutcome(const Cell& cell, const Outcome& outcome) {
  if (IsRefusedByTheService(cell)) {
    EXPECT_EQ(outcome.errorClass, typeid(SsoException));
    EXPECT_EQ(outcome.message, "Unexpected SOAP fault: wst:InvalidRequest; request failed.");
    return;
  }
  ASSERT_TRUE(outcome.IsSuccess()) << outcome.message;
  if (cell.operation == Operation::Validate) {
    EXPECT_EQ(outcome.verdict, true);
    return;
  }
  const bool isBound = cell.operation == Operation::Renew || cell.expected.keyType == "PublicKey";
  EXPECT_EQ(outcome.token->ConfirmationType(), isBound ? HOLDER_OF_KEY : BEARER);
}

TEST_P(SigningDecisionTest, IsTheExpectedOne) {
  const Cell& cell = GetParam();
  const Arguments arguments = ArgumentsOf(cell);
  const auto service = cell.hasKey ? HolderService() : Service();
  Sts().ClearRequests();
  const Outcome outcome = CallNow(cell.operation, *service, arguments);

  const auto requests = Sts().Requests();
  if (cell.expected.failure != typeid(void)) {
    EXPECT_EQ(outcome.errorClass, cell.expected.failure);
    EXPECT_EQ(outcome.message, cell.expected.message);
    EXPECT_THAT(requests, IsEmpty());
    return;
  }
  ExpectOutcome(cell, outcome);
  ASSERT_EQ(requests.size(), 1U);
  const WireRequest wire = ReadWireRequest(requests[0].body);
  EXPECT_THAT(wire.securityEntries, ElementsAreArray(cell.expected.securityEntries));
  EXPECT_EQ(wire.keyType, cell.expected.keyType);
  EXPECT_EQ(wire.useKey, cell.expected.useKey);
  ExpectSigned(cell.expected.securityEntries, requests[0], wire);
}

constexpr auto kPass = Operation::Password;
constexpr auto kCert = Operation::Certificate;
constexpr auto kTok = Operation::Token;
constexpr auto kRen = Operation::Renew;
constexpr auto kVal = Operation::Validate;

const Expected kBearerByPassword = {kWithPassword, "Bearer", ""};
const Expected kNoCertificateKey = WithoutKey("acquire token by certificate");
const Expected kNoTokenKey = WithoutKey("acquire token by token");
const Expected kNoRenewKey = WithoutKey("renew token");
const Expected kNotDefault = Refused(
    typeid(Tarnik::InvalidArgumentException),
    "TokenSpec::confirmation must be CONFIRMATION_DEFAULT for acquire token by certificate");
const Expected kNotBound =
    Refused(typeid(Tarnik::InvalidArgumentException),
            "Unable to renew token: the provided token must be Holder Of Key");

INSTANTIATE_TEST_SUITE_P(
    WithoutConfig, SigningDecisionTest,
    testing::Values(Cell{"Password", kPass, false, false, false, kBearerByPassword},
                    Cell{"PasswordActAs", kPass, false, false, true, kBearerByPassword},
                    Cell{"PasswordBearer", kPass, false, true, false, kBearerByPassword},
                    Cell{"PasswordBearerActAs", kPass, false, true, true, kBearerByPassword},
                    Cell{"Certificate", kCert, false, false, false, kNoCertificateKey},
                    Cell{"CertificateActAs", kCert, false, false, true, kNoCertificateKey},
                    Cell{"CertificateBearer", kCert, false, true, false, kNoCertificateKey},
                    Cell{"CertificateBearerActAs", kCert, false, true, true, kNoCertificateKey},
                    Cell{"Token", kTok, false, false, false, kNoTokenKey},
                    Cell{"TokenActAs", kTok, false, false, true, kNoTokenKey},
                    Cell{"TokenBearer", kTok, false, true, false, kNoTokenKey},
                    Cell{"TokenBearerActAs", kTok, false, true, true, kNoTokenKey},
                    Cell{"RenewBound", kRen, false, false, false, kNoRenewKey},
                    Cell{"RenewBearer", kRen, false, true, false, kNoRenewKey},
                    Cell{"ValidateBound", kVal, false, false, false, {kPlain, "", ""}},
                    Cell{"ValidateBearer", kVal, false, true, false, {kPlain, "", ""}}),
    [](const auto& tested) { return tested.param.name; });

INSTANTIATE_TEST_SUITE_P(
    WithConfig, SigningDecisionTest,
    testing::Values(
        Cell{"Password", kPass, true, false, false, {kSignedPassword, "PublicKey", kProof}},
        Cell{"PasswordActAs", kPass, true, false, true, {kWithPassword, "PublicKey", kProof}},
        Cell{"PasswordBearer", kPass, true, true, false, kBearerByPassword},
        Cell{"PasswordBearerActAs", kPass, true, true, true, kBearerByPassword},
        Cell{"Certificate", kCert, true, false, false, {kByCertificate, "PublicKey", kProof}},
        Cell{"CertificateActAs", kCert, true, false, true, {kByCertificate, "PublicKey", kProof}},
        Cell{"CertificateBearer", kCert, true, true, false, kNotDefault},
        Cell{"CertificateBearerActAs", kCert, true, true, true, kNotDefault},
        Cell{"Token", kTok, true, false, false, {kByToken, "PublicKey", ""}},
        Cell{"TokenActAs", kTok, true, false, true, {kByToken, "PublicKey", ""}},
        Cell{"TokenBearer", kTok, true, true, false, {kByToken, "Bearer", ""}},
        Cell{"TokenBearerActAs", kTok, true, true, true, {kByToken, "Bearer", ""}},
        Cell{"RenewBound", kRen, true, false, false, {kByCertificate, "", ""}},
        Cell{"RenewBearer", kRen, true, true, false, kNotBound},
        Cell{"ValidateBound", kVal, true, false, false, {kPlain, "", ""}},
        Cell{"ValidateBearer", kVal, true, true, false, {kPlain, "", ""}}),
    [](const auto& tested) { return tested.param.name; });

class LocalCheckTest : public HolderOfKeyTest {};

TEST_F(LocalCheckTest, LifetimeIsCheckedFirstAndNothingIsSent) {
  Arguments arguments;
  arguments.token = Acquire();
  arguments.spec.confirmation = CONFIRMATION_BEARER;
  Sts().ClearRequests();
  for (const auto& service : {HolderService(), Service()}) {
    for (const Operation operation : {kPass, kCert, kTok, kRen}) {
      for (const long lifetime : {0L, -1L}) {
        arguments.spec.tokenLifetimeSec = lifetime;
        const Outcome outcome = CallNow(operation, *service, arguments);
        EXPECT_EQ(outcome.errorClass, typeid(Tarnik::InvalidArgumentException)) << operation;
        EXPECT_EQ(outcome.message, "Token lifetime must be positive") << operation;
      }
    }
  }
  EXPECT_THAT(Sts().Requests(), IsEmpty());
}

TEST_F(LocalCheckTest, OneSecondIsAValidLifetime) {
  Arguments arguments;
  arguments.token = AcquireBound();
  arguments.spec.tokenLifetimeSec = 1;
  for (const Operation operation : {kPass, kCert, kTok, kRen}) {
    const Outcome outcome = CallNow(operation, *HolderService(), arguments);
    EXPECT_TRUE(outcome.IsSuccess()) << operation << ": " << outcome.message;
  }
}

// The delegate, not the requester, will prove a key.
TEST_F(LocalCheckTest, DelegateToLeavesUseKeyOutOfASignedRequest) {
  Arguments arguments;
  arguments.spec.delegateTo = std::string("bob@EXAMPLE.COM");
  for (const Operation operation : {kPass, kCert}) {
    const Outcome outcome = CallNow(operation, *HolderService(), arguments);
    EXPECT_TRUE(outcome.IsSuccess()) << outcome.message;
    const WireRequest wire = ReadWireRequest(Sts().LastRequest().body);
    EXPECT_EQ(wire.keyReference, "Reference");
    EXPECT_EQ(wire.keyType, "PublicKey");
    EXPECT_EQ(wire.useKey, "");
  }
}

}  // namespace
}  // namespace SsoClient::Testing
