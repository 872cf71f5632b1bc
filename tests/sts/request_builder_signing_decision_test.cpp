#include <string>
#include <vector>

#include <boost/none.hpp>
#include <gtest/gtest.h>

#include <devsts/xml_security.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/exception.h>

#include "sts/request_builder.h"
#include "sts/request_operations.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::InvalidArgumentException;
using Tarnik::InvalidStateException;

// The expected request; an error message instead of a header if it is refused.
struct SigningCase {
  const char* name;
  BuildOperation operation;
  bool hasKey;
  ConfirmationType confirmation;
  bool isActingAs;
  std::vector<std::string> header;
  const char* keyType;  // null if the body has none
  bool hasUseKey;
  const char* refusal = nullptr;
};

constexpr char kPublicKey[] = "PublicKey";
constexpr char kBearer[] = "Bearer";
constexpr char kNoKeyForCertificate[] =
    "No HolderOfKeyConfig provided. Unable to acquire token by certificate";
constexpr char kNoKeyForToken[] = "No HolderOfKeyConfig provided. Unable to acquire token by token";
constexpr char kNotDefault[] =
    "TokenSpec::confirmation must be CONFIRMATION_DEFAULT for acquire token by certificate";
constexpr auto kDefault = CONFIRMATION_DEFAULT;
constexpr auto kOther = CONFIRMATION_BEARER;
constexpr auto kUnnamed =
    static_cast<ConfirmationType>(-1);  // every value except zero means bearer

const std::vector<std::string> kPlainPassword{kTimestamp, kUsername};
const std::vector<std::string> kSignedPassword{kTimestamp, kUsername, kCertificate, kSignature};
const std::vector<std::string> kByCertificate{kTimestamp, kCertificate, kSignature};
const std::vector<std::string> kByToken{kTimestamp, kAssertion, kSignature};
const std::vector<std::string> kPlain{kTimestamp};

class RequestSigningTest : public testing::TestWithParam<SigningCase> {};

std::string Refusal(const SigningCase& tested, const RequestBuilderImpl& builder,
                    const TokenSpec& spec) {
  SoapRequest request;
  const auto message =
      tested.hasKey
          ? ThrownMessage<InvalidArgumentException>(
                [&] { tested.operation(builder, spec, request); })
          : ThrownMessage<InvalidStateException>([&] { tested.operation(builder, spec, request); });
  EXPECT_EQ(request.body, "");
  EXPECT_EQ(request.action, "");
  return message;
}

TEST_P(RequestSigningTest, IsDecidedByKeyConfirmationActAsTokenAndOperation) {
  const auto& tested = GetParam();
  const auto builder = tested.hasKey ? BuilderWithKey() : RequestBuilderImpl(boost::none);
  const auto spec = SpecOf(60, tested.confirmation, tested.isActingAs);
  if (tested.refusal != nullptr) {
    EXPECT_EQ(Refusal(tested, builder, spec), tested.refusal);
    return;
  }
  SoapRequest request;
  tested.operation(builder, spec, request);
  EXPECT_EQ(HeaderOf(request.body), tested.header);
  const std::string keyType = tested.keyType == nullptr
                                  ? "wst:KeyType"
                                  : std::string("/") + tested.keyType + "</wst:KeyType>";
  EXPECT_EQ(request.body.find(keyType) != std::string::npos, tested.keyType != nullptr);
  EXPECT_EQ(
      request.body.find("<wst:UseKey Sig=\"holderOfKeyProofSignature\"/>") != std::string::npos,
      tested.hasUseKey);
  if (tested.header.back() == kSignature) {
    const auto verdict = DevSts::VerifyXml(request.body, Credential().certificatePem);
    EXPECT_TRUE(verdict.valid) << verdict.reason;
  }
}

INSTANTIATE_TEST_SUITE_P(
    Requests, RequestSigningTest,
    testing::Values(
        SigningCase{"PasswordNoKey", ByPassword, false, kDefault, false, kPlainPassword, kBearer,
                    false},
        SigningCase{"PasswordNoKeyBearer", ByPassword, false, kOther, false, kPlainPassword,
                    kBearer, false},
        SigningCase{"PasswordNoKeyActAs", ByPassword, false, kDefault, true, kPlainPassword,
                    kBearer, false},
        SigningCase{"PasswordNoKeyBearerActAs", ByPassword, false, kOther, true, kPlainPassword,
                    kBearer, false},
        SigningCase{"Password", ByPassword, true, kDefault, false, kSignedPassword, kPublicKey,
                    true},
        SigningCase{"PasswordBearer", ByPassword, true, kOther, false, kPlainPassword, kBearer,
                    false},
        SigningCase{"PasswordOfAnotherConfirmation", ByPassword, true, kUnnamed, false,
                    kPlainPassword, kBearer, false},
        SigningCase{"PasswordActAs", ByPassword, true, kDefault, true, kPlainPassword, kPublicKey,
                    true},
        SigningCase{"PasswordBearerActAs", ByPassword, true, kOther, true, kPlainPassword, kBearer,
                    false},
        SigningCase{"InitialLegNoKey", InitialLeg, false, kDefault, false, kPlain, kBearer, false},
        SigningCase{"InitialLegNoKeyActAs", InitialLeg, false, kDefault, true, kPlain, kBearer,
                    false},
        SigningCase{"InitialLeg", InitialLeg, true, kDefault, false, kByCertificate, kPublicKey,
                    true},
        SigningCase{"InitialLegBearer", InitialLeg, true, kOther, false, kPlain, kBearer, false},
        SigningCase{"InitialLegActAs", InitialLeg, true, kDefault, true, kPlain, kPublicKey, true},
        SigningCase{"ContinuedLegNoKey", ContinuedLeg, false, kDefault, false, kPlain, nullptr,
                    false},
        SigningCase{"ContinuedLeg", ContinuedLeg, true, kDefault, false, kPlain, nullptr, false},
        SigningCase{"CertificateNoKey",
                    ByCertificate,
                    false,
                    kDefault,
                    false,
                    {},
                    nullptr,
                    false,
                    kNoKeyForCertificate},
        SigningCase{"CertificateNoKeyBearer",
                    ByCertificate,
                    false,
                    kOther,
                    false,
                    {},
                    nullptr,
                    false,
                    kNoKeyForCertificate},
        SigningCase{"Certificate", ByCertificate, true, kDefault, false, kByCertificate, kPublicKey,
                    true},
        SigningCase{"CertificateActAs", ByCertificate, true, kDefault, true, kByCertificate,
                    kPublicKey, true},
        SigningCase{"CertificateBearer",
                    ByCertificate,
                    true,
                    kOther,
                    false,
                    {},
                    nullptr,
                    false,
                    kNotDefault},
        SigningCase{"CertificateBearerActAs",
                    ByCertificate,
                    true,
                    kOther,
                    true,
                    {},
                    nullptr,
                    false,
                    kNotDefault},
        SigningCase{"CertificateOfAnotherConfirmation",
                    ByCertificate,
                    true,
                    kUnnamed,
                    false,
                    {},
                    nullptr,
                    false,
                    kNotDefault},
        SigningCase{"TokenOfAnotherConfirmation", ByToken, true, kUnnamed, false, kByToken, kBearer,
                    false},
        SigningCase{"InitialLegOfAnotherConfirmation", InitialLeg, true, kUnnamed, false, kPlain,
                    kBearer, false},
        SigningCase{
            "TokenNoKey", ByToken, false, kDefault, false, {}, nullptr, false, kNoKeyForToken},
        SigningCase{"Token", ByToken, true, kDefault, false, kByToken, kPublicKey, false},
        SigningCase{"TokenActAs", ByToken, true, kDefault, true, kByToken, kPublicKey, false},
        SigningCase{"TokenBearer", ByToken, true, kOther, false, kByToken, kBearer, false},
        SigningCase{"TokenBearerActAs", ByToken, true, kOther, true, kByToken, kBearer, false},
        SigningCase{"ValidateNoKey", Validate, false, kDefault, false, kPlain, nullptr, false},
        SigningCase{"Validate", Validate, true, kDefault, false, kPlain, nullptr, false},
        SigningCase{
            "RenewNoKey", Renew, false, kDefault, false, {}, nullptr, false, kNoKeyForRenewal},
        SigningCase{"Renew", Renew, true, kDefault, false, kByCertificate, nullptr, false}),
    [](const auto& tested) { return tested.param.name; });

}  // namespace
}  // namespace SsoClient::Testing
