#include <cstddef>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/err.h>
#include <openssl/pem.h>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/revocation_list.h>

#include "support/openssl.h"
#include "support/temporary_file.h"
#include "support/test_certificates.h"
#include "support/test_pki.h"
#include "support/test_revocation_lists.h"
#include "support/thrown_message.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Crypto;
using testing::HasSubstr;
using testing::StartsWith;

using List = Ref<const RevocationList>;

List Decode(const std::vector<unsigned char>& der) {
  return CreateRevocationListFromDer(der.data(), der.size());
}

List MakeList(const RevocationListRecipe& recipe = {}) {
  return Decode(MakeRevocationListDer(recipe));
}

std::string ToPemList(const std::vector<unsigned char>& der) {
  const OpenSsl::OwnedBio memory(BIO_new(BIO_s_mem()));
  PEM_write_bio(memory.get(), "X509 CRL", "", der.data(), static_cast<long>(der.size()));
  char* text = nullptr;
  const long length = BIO_get_mem_data(memory.get(), &text);
  return {text, static_cast<std::size_t>(length)};
}

std::string Since(const List& list, const char* serial, const char* issuer = "signer") {
  const auto certificate = MakeCertificate({.issuerCommonName = issuer, .serial = serial});
  const auto since = list->RevokedSince(*certificate);
  return since ? since->ToString() : "never";
}

TEST(RevocationListTest, ReturnsItsFields) {
  const auto list = MakeList({.issuerCommonName = "J\xC3\xBCrgen"});
  EXPECT_EQ(list->IssuerName(), "CN=J\xC3\xBCrgen,O=Test\\, Inc.");
  EXPECT_EQ(list->IssuerName(),
            MakeCertificate({.issuerCommonName = "J\xC3\xBCrgen"})->IssuerName());
  EXPECT_EQ(list->ThisUpdate().ToString(), "2024-07-01T00:00:00.000Z");
  EXPECT_EQ(list->NextUpdate().ToString(), "2099-07-01T00:00:00.000Z");
  EXPECT_EQ(list->ToString(), "Revocation list of CN=J\xC3\xBCrgen,O=Test\\, Inc.");
}

TEST(RevocationListTest, FindsSerialNumbersOfAnyLength) {
  const std::vector<const char*> listed{
      "0", "1", "127", "128", "255", "256", "65536", "340282366920938463463374607431768211455"};
  RevocationListRecipe recipe;
  for (const char* serial : listed) {
    recipe.entries.push_back({serial});
  }
  const auto list = MakeList(recipe);
  for (const char* serial : listed) {
    EXPECT_EQ(Since(list, serial), "2024-06-01T00:00:00.000Z") << serial;
  }
  for (const char* serial : {"2", "129", "-1", "-128", "257", "65537", "1208925819614629174706175",
                             "340282366920938463463374607431768211454"}) {
    EXPECT_EQ(Since(list, serial), "never") << serial;
  }
}

TEST(RevocationListTest, DistinguishesTheSignOfASerialNumber) {
  const auto list = MakeList({.entries = {{"-5"}}});
  EXPECT_NE(Since(list, "-5"), "never");
  EXPECT_EQ(Since(list, "5"), "never");
}

TEST(RevocationListTest, ReturnsTheEarliestTimeOfASerialNumber) {
  const auto list = MakeList({.entries = {{"5", "20240501000000Z"},
                                          {"5", "20240401000000Z"},
                                          {"6", "20240101000000Z"},
                                          {"5", "20240601000000Z"}}});
  EXPECT_EQ(Since(list, "5"), "2024-04-01T00:00:00.000Z");
}

TEST(RevocationListTest, MayBeEmpty) {
  const auto list = MakeList();
  EXPECT_TRUE(list->Covers(*MakeCertificate()));
  EXPECT_EQ(Since(list, "4711"), "never");
}

TEST(RevocationListTest, SaysNothingOfAnotherIssuersCertificateWithTheSerialNumber) {
  const auto list = MakeList({.entries = {{"4711"}}});
  EXPECT_NE(Since(list, "4711"), "never");
  EXPECT_EQ(Since(list, "4711", "other"), "never");
  EXPECT_FALSE(list->Covers(*MakeCertificate({.issuerCommonName = "other"})));
}

// RFC 5280, section 7.1.
TEST(RevocationListTest, CoversItsIssuersNameInOtherStringsAndCase) {
  for (const int type : {V_ASN1_PRINTABLESTRING, V_ASN1_IA5STRING, V_ASN1_BMPSTRING}) {
    const auto list =
        MakeList({.issuerCommonName = "SIGNER", .nameType = type, .entries = {{"4711"}}});
    EXPECT_NE(Since(list, "4711"), "never") << type;
    EXPECT_TRUE(list->IsFrom(*MakeCertificate())) << type;
  }
}

constexpr const char* kReason = "2.5.29.21";
constexpr const char* kUnknown = "1.2.3.4";

RevocationListRecipe WithReason(char reason) {
  return {.entries = {
              {.serial = "7", .extension = kReason, .content = std::string("\x0A\x01") + reason}}};
}

// RFC 5280, section 5.3.1; 6 is certificateHold.
TEST(RevocationListTest, RevokesForEveryReason) {
  for (const char reason : {0, 1, 2, 3, 4, 5, 6, 9, 10, 77}) {
    EXPECT_NE(Since(MakeList(WithReason(reason)), "7"), "never") << int{reason};
  }
}

TEST(RevocationListTest, IgnoresExtensionsThatAreNotCritical) {
  const auto list =
      MakeList({.entries = {{.serial = "7", .extension = kUnknown}}, .edit = [](X509_CRL* raw) {
                  X509_CRL_add_ext(raw, MakeRawExtension(false).get(), -1);
                }});
  EXPECT_NE(Since(list, "7"), "never");
}

std::string ErrorOf(const RevocationListRecipe& recipe) {
  const auto der = MakeRevocationListDer(recipe);
  return ThrownMessage<CryptoException>([&der] { Decode(der); }, "accepted");
}

std::string ErrorWithExtension(bool isCritical, const char* type, const std::string& content) {
  return ErrorOf({.edit = [&](X509_CRL* raw) {
    X509_CRL_add_ext(raw, MakeRawExtension(isCritical, type, content).get(), -1);
  }});
}

TEST(RevocationListErrorTest, NoNextUpdate) {
  EXPECT_EQ(ErrorOf({.nextUpdate = nullptr}), "The revocation list has no nextUpdate.");
  EXPECT_EQ(ErrorOf({.nextUpdate = "20240701000000Z"}), "accepted");
  EXPECT_EQ(ErrorOf({.nextUpdate = "20240630235959Z"}),
            "The revocation list's nextUpdate is before its thisUpdate.");
}

// RFC 5280, section 5.1.2.1.
TEST(RevocationListErrorTest, UnknownVersion) {
  for (const long version : {-256L, -5L, -1L, 0L, 1L, 2L, 256L}) {
    const bool isKnown = version == X509_CRL_VERSION_1 || version == X509_CRL_VERSION_2;
    EXPECT_EQ(ErrorOf({.edit = [&](X509_CRL* raw) { X509_CRL_set_version(raw, version); }}),
              isKnown ? "accepted" : "The revocation list has an unknown version.")
        << version;
  }
}

TEST(RevocationListErrorTest, DeltaList) {
  for (const bool isCritical : {true, false}) {
    EXPECT_EQ(ErrorWithExtension(isCritical, "2.5.29.27", "\x02\x01\x01"),
              "The revocation list is a delta list, which is not supported.");
    EXPECT_EQ(ErrorWithExtension(isCritical, "2.5.29.20", "\x02\x01\x01"), "accepted");
  }
}

// A distribution point, onlyContainsUserCerts, onlyContainsCACerts, onlySomeReasons, indirectCRL
// and onlyContainsAttributeCerts (RFC 5280, section 5.2.5).
TEST(RevocationListErrorTest, PartialOrIndirectList) {
  for (const std::string& content :
       {std::string("\x30\x08\xA0\x06\xA0\x04\x86\x02u:"), std::string("\x30\x03\x81\x01\xFF"),
        std::string("\x30\x03\x82\x01\xFF"), std::string("\x30\x04\x83\x02\x06\x40"),
        std::string("\x30\x03\x84\x01\xFF"), std::string("\x30\x03\x85\x01\xFF"),
        std::string("\x30\x00", 2), std::string("broken")}) {
    for (const bool isCritical : {true, false}) {
      const std::string error = ErrorWithExtension(isCritical, "2.5.29.28", content);
      EXPECT_THAT(error, testing::AnyOf(StartsWith("The revocation list has an "
                                                   "issuingDistributionPoint: "),
                                        StartsWith("The revocation list cannot be decoded")));
    }
  }
}

TEST(RevocationListErrorTest, UnknownCriticalExtension) {
  EXPECT_EQ(ErrorWithExtension(true, "1.2.3.4", "x"),
            "The revocation list has a critical extension that is not supported.");
  EXPECT_EQ(ErrorWithExtension(false, "1.2.3.4", "x"), "accepted");
  RevocationListRecipe recipe{.entries = {{"8"}, {.serial = "7", .extension = kUnknown}}};
  EXPECT_EQ(ErrorOf(recipe), "accepted");
  recipe.entries.back().isCritical = true;
  EXPECT_EQ(ErrorOf(recipe),
            "An entry of the revocation list has a critical extension that is not supported.");
}

TEST(RevocationListErrorTest, RepeatedExtension) {
  EXPECT_EQ(ErrorOf({.edit =
                         [](X509_CRL* raw) {
                           X509_CRL_add_ext(raw, MakeRawExtension(false).get(), -1);
                           X509_CRL_add_ext(raw, MakeRawExtension(false).get(), -1);
                         }}),
            "The revocation list has an extension twice.");
}

TEST(RevocationListErrorTest, TooManyExtensions) {
  const auto withExtensions = [](int count) {
    return ErrorOf({.edit = [count](X509_CRL* raw) {
      for (int i = 0; i < count; ++i) {
        const std::string type = "1.2.3." + std::to_string(i);
        X509_CRL_add_ext(raw, MakeRawExtension(false, type.c_str()).get(), -1);
      }
    }});
  };
  EXPECT_EQ(withExtensions(32), "accepted");
  EXPECT_EQ(withExtensions(33), "The revocation list has more than 32 extensions.");
}

TEST(RevocationListErrorTest, BrokenAuthorityKeyIdentifier) {
  EXPECT_THAT(ErrorWithExtension(false, "2.5.29.35", "broken"), StartsWith("The revocation list"));
  EXPECT_EQ(ErrorWithExtension(false, "2.5.29.35", std::string("\x30\x00", 2)), "accepted");
}

TEST(RevocationListErrorTest, EntryOfAnotherIssuer) {
  for (const bool isCritical : {true, false}) {
    EXPECT_EQ(ErrorOf({.entries = {{.serial = "7",
                                    .extension = "2.5.29.29",
                                    .content = "\x30\x06\x86\x04urn:",
                                    .isCritical = isCritical}}}),
              "The revocation list has an entry of another issuer, which is not supported.");
  }
}

TEST(RevocationListErrorTest, EntryThatLiftsARevocation) {
  EXPECT_EQ(ErrorOf(WithReason(8)),
            "The revocation list has an entry with the reason removeFromCRL.");
}

TEST(RevocationListErrorTest, BrokenReason) {
  EXPECT_THAT(
      ErrorOf({.entries = {{.serial = "7", .extension = kReason, .content = "\x0A\x02\x01"}}}),
      StartsWith("The revocation list's reason of an entry cannot be decoded"));
}

TEST(RevocationListErrorTest, LongSerialNumber) {
  const OpenSsl::OwnedBigNumber number(BN_new());
  for (const auto& [bit, expected] :
       {std::pair(511, "accepted"),
        std::pair(512, "The revocation list has a serial number of more than 64 bytes.")}) {
    BN_zero(number.get());
    ASSERT_EQ(BN_set_bit(number.get(), bit), 1);
    const OpenSsl::OwnedMemory<char> decimal(BN_bn2dec(number.get()));
    EXPECT_EQ(ErrorOf({.entries = {{decimal.get()}}}), expected);
  }
}

TEST(RevocationListErrorTest, NoIssuer) {
  const auto der = MakeRevocationListDer({.edit = [](X509_CRL* raw) {
    const OpenSsl::Owned<X509_NAME, X509_NAME_free> empty(X509_NAME_new());
    X509_CRL_set_issuer_name(raw, empty.get());
  }});
  EXPECT_EQ(ThrownMessage<CryptoException>([&der] { Decode(der); }),
            "The revocation list names no issuer.");
}

TEST(RevocationListErrorTest, EveryProperPrefixAndTrailingBytes) {
  auto der = MakeRevocationListDer({.entries = {{"7"}}});
  auto longer = der;
  longer.push_back(0);
  EXPECT_EQ(ThrownMessage<CryptoException>([&longer] { Decode(longer); }),
            "The revocation list is followed by other bytes.");
  while (!der.empty()) {
    der.pop_back();
    ASSERT_THROW(Decode(der), CryptoException) << der.size();
  }
  EXPECT_THROW(CreateRevocationListFromDer(nullptr, 0), CryptoException);
}

TEST(RevocationListTest, LeavesTheErrorQueueUnchanged) {
  ERR_clear_error();
  ERR_raise(ERR_LIB_USER, 77);
  const unsigned long before = ERR_peek_error();
  const auto list = MakeList({.entries = {{"4711"}}});
  EXPECT_TRUE(list->IsFrom(*MakeCertificate()));
  EXPECT_NE(Since(list, "4711"), "never");
  EXPECT_EQ(ErrorOf({.nextUpdate = nullptr}), "The revocation list has no nextUpdate.");
  EXPECT_EQ(ERR_peek_last_error(), before);
  ERR_clear_error();
}

TEST(RevocationListFilesTest, AreReadFromBothForms) {
  const auto one = MakeRevocationListDer({.issuerCommonName = "one"});
  const auto two = MakeRevocationListDer({.issuerCommonName = "two"});
  const TemporaryFile pem("lists:\n" + ToPemList(one) + ToPemList(two));
  const TemporaryFile der({two.begin(), two.end()});
  ASSERT_EQ(LoadRevocationLists(pem.Path()).size(), 2U);
  EXPECT_EQ(LoadRevocationLists(pem.Path())[1]->IssuerName(), "CN=two,O=Test\\, Inc.");
  ASSERT_EQ(LoadRevocationLists(der.Path()).size(), 1U);
  EXPECT_EQ(LoadRevocationLists(der.Path())[0]->IssuerName(), "CN=two,O=Test\\, Inc.");
}

TEST(RevocationListFilesTest, AreRefusedWithTheNameOfTheFile) {
  const TemporaryFile empty("");
  EXPECT_EQ(ThrownMessage<CryptoException>([&empty] { LoadRevocationLists(empty.Path()); }),
            "The revocation list file '" + empty.Path() +
                "' cannot be used: The PEM text holds no revocation list.");
  const std::string good = ToPemList(MakeRevocationListDer());
  const TemporaryFile half(good + good.substr(0, good.size() / 2));
  EXPECT_THAT(ThrownMessage<CryptoException>([&half] { LoadRevocationLists(half.Path()); }),
              HasSubstr("The PEM text is broken"));
  EXPECT_THAT(ThrownMessage<IOException>([] { LoadRevocationLists("/nonexistent/a.crl"); }),
              HasSubstr("/nonexistent/a.crl"));
}

// As a server's list, with an authority key identifier, and PEM as other tools write it.
TEST(RevocationListFilesTest, AreReadAsACertificationAuthorityWritesThem) {
  const Identity ca = MakeCa("ca");
  const Identity revoked = MakeIdentity({}, &ca);
  const Identity other = MakeIdentity({}, &ca);
  const auto lists = CreateRevocationListsFromPem(MakeCrl(ca, &revoked));
  ASSERT_EQ(lists.size(), 1U);
  EXPECT_TRUE(lists[0]->IsFrom(*ca.ToCertificate()));
  EXPECT_TRUE(lists[0]->RevokedSince(*revoked.ToCertificate()).has_value());
  EXPECT_FALSE(lists[0]->RevokedSince(*other.ToCertificate()).has_value());
  EXPECT_TRUE(lists[0]->Covers(*other.ToCertificate()));
}

}  // namespace
}  // namespace Tarnik::Testing
