#include "crypto/distinguished_name.h"

#include <cstddef>
#include <map>
#include <set>
#include <sstream>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>
#include <openssl/err.h>

#include <tarnik/crypto/certificate.h>

#include "crypto/certificate_impl.h"
#include "crypto/distinguished_name_reader.h"
#include "support/openssl.h"
#include "support/test_certificates.h"
#include "support/test_data.h"

namespace Tarnik::Testing {
namespace {

using Crypto::DistinguishedName;
using OwnedName = OpenSsl::Owned<X509_NAME, X509_NAME_free>;

struct Entry {
  const char* type;
  int stringType;
  std::string value;
  int set = 0;  // -1: in the part of the entry before
};

DistinguishedName NameOf(const std::vector<Entry>& entries) {
  const OwnedName name(X509_NAME_new());
  for (const Entry& entry : entries) {
    Require(X509_NAME_add_entry_by_txt(name.get(), entry.type, entry.stringType,
                                       reinterpret_cast<const unsigned char*>(entry.value.data()),
                                       static_cast<int>(entry.value.size()), -1, entry.set) == 1,
            "name");
  }
  return DistinguishedName(name.get());
}

const DistinguishedName& SubjectOf(const Crypto::Certificate& certificate) {
  return dynamic_cast<const Crypto::CertificateImpl&>(certificate).Subject();
}

struct Spelling {
  std::size_t name = 0;
  std::string writer;
  std::string text;
};

// Lines of the form NUMBER, WRITER, TEXT with tabs between them.
std::vector<Spelling> ReadSpellings() {
  std::vector<Spelling> spellings;
  std::istringstream lines(ReadTestData("key_info/names.txt"));
  for (std::string line; std::getline(lines, line);) {
    const std::size_t first = line.find('\t');
    const std::size_t second = line.find('\t', first + 1);
    spellings.push_back({std::stoul(line.substr(0, first)),
                         line.substr(first + 1, second - first - 1), line.substr(second + 1)});
  }
  return spellings;
}

// 17 names, in nine spellings.
class SpelledNamesTest : public testing::Test {
 protected:
  const std::vector<Ref<const Crypto::Certificate>> certificates_ =
      Crypto::CreateCertificatesFromPem(ReadTestData("key_info/names.pem"));
  const std::vector<Spelling> spellings_ = ReadSpellings();
};

TEST_F(SpelledNamesTest, AreAllThere) {
  ASSERT_EQ(certificates_.size(), 17U);
  std::map<std::string, std::set<std::size_t>> namesOf;
  for (const Spelling& spelling : spellings_) {
    EXPECT_FALSE(spelling.text.empty());
    namesOf[spelling.writer].insert(spelling.name);
  }
  EXPECT_EQ(namesOf.size(), 9U);
  for (const auto& [writer, names] : namesOf) {
    EXPECT_EQ(names.size(), 17U) << writer;
  }
}

TEST_F(SpelledNamesTest, EqualTheirNameAndNoOther) {
  ASSERT_EQ(spellings_.size(), 17U * 9U);
  for (const Spelling& spelling : spellings_) {
    const auto name = DistinguishedName::FromText(spelling.text);
    for (std::size_t i = 0; i < certificates_.size(); ++i) {
      EXPECT_EQ(name.Equals(SubjectOf(*certificates_[i])), i + 1 == spelling.name)
          << spelling.writer << ": " << spelling.text << " and name " << i + 1;
    }
  }
}

// Types are left out, since one may be a prefix of another.
TEST_F(SpelledNamesTest, DoNotEqualTheirNameWithoutALetterOrDigitOfAValue) {
  constexpr std::string_view kTypes =
      "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789.";
  std::size_t compared = 0;
  for (const Spelling& spelling : spellings_) {
    const DistinguishedName& name = SubjectOf(*certificates_[spelling.name - 1]);
    for (std::size_t i = 0; i < spelling.text.size(); ++i) {
      const std::size_t next = spelling.text.find_first_not_of(kTypes, i);
      if (next == i || (next != std::string::npos && spelling.text[next] == '=')) {
        continue;
      }
      std::string shorter = spelling.text;
      shorter.erase(i, 1);
      ++compared;
      EXPECT_FALSE(DistinguishedName::FromText(shorter).Equals(name)) << shorter;
    }
  }
  EXPECT_GT(compared, 3000U);
}

// O=Example,OU=Login+CN=sts in the encoded order.
DistinguishedName Example() {
  return NameOf({{"O", V_ASN1_UTF8STRING, "Example"},
                 {"OU", V_ASN1_UTF8STRING, "Login"},
                 {"CN", V_ASN1_UTF8STRING, "sts", -1}});
}

bool IsExample(std::string_view text) {
  return DistinguishedName::FromText(text).Equals(Example());
}

TEST(DistinguishedNameTest, MayBeWrittenInManyWays) {
  for (const char* text :
       {"OU=Login+CN=sts,O=Example", "CN=sts+OU=Login,O=Example", "CN=sts + OU=Login, O=Example",
        "cn=STS+ou=login,o=example", "  OU = Login +\tCN =  sts ;\r\n O = Example  ",
        "OU=\"Login\"+CN=\"sts\", O=\"Example\"", "OU=\\4c\\6F\\67in+CN=s\\74s,O=Example",
        "OU=Login+CN=#0c03737473,O=Example", "OID.2.5.4.11=Login+2.5.4.3=sts,oid.2.5.4.10=Example",
        "OU=Login+CN=#0C03737473,2.5.4.10=#13074578616D706C65 ",
        "organizationalUnitName=Login+commonName=sts,organizationName=Example",
        "OU=\\ Login\\ +CN=sts,O=Example"}) {
    EXPECT_TRUE(IsExample(text)) << text;
  }
}

TEST(DistinguishedNameTest, DiffersFromNearMisses) {
  for (const char* text : {"O=Example,OU=Login+CN=sts",
                           "OU=Login,CN=sts,O=Example",
                           "CN=sts,OU=Login,O=Example",
                           "OU=Login+CN=sts,O=Example,O=Example",
                           "OU=Login+CN=sts",
                           "O=Example",
                           "CN=sts,O=Example",
                           "OU=Login+CN=sts,O=Example,C=DE",
                           "C=DE,OU=Login+CN=sts,O=Example",
                           "OU=Login+CN=sts+CN=sts,O=Example",
                           "OU=sts+CN=Login,O=Example",
                           "OU=Login+CN=sts,O=Example2",
                           "OU=Login+CN=sts,O=Exampl",
                           "OU=Login+CN=s ts,O=Example",
                           "OU=Login+CN=sts\\00,O=Example",
                           "OU=Login+CN=sts\\00.evil,O=Example",
                           "OU=Login\\+CN=sts,O=Example",
                           "OU=Login+CN=sts\\,O=Example",
                           "OU=\"Login+CN=sts\",O=Example",
                           "OU=\"Login+CN=sts,O=Example\"",
                           "OU=Login+CN=#0403737473,O=Example",
                           "OU=Login+CN=#0c0373747300,O=Example",
                           "OU=Login+SN=sts,O=Example",
                           "OU=Login+CN=\\#0c03737473,O=Example",
                           "OU=Login+CN=\"#0c03737473\",O=Example",
                           "OU=Login+2.5.4.4=sts,O=Example",
                           "OU=Login+CN=sts O=Example",
                           "OU=Login+CN=sts/O=Example",
                           "OU=Login+CN=\xD1\x95ts,O=Example"}) {
    EXPECT_FALSE(IsExample(text)) << text;
  }
  EXPECT_TRUE(IsExample("OU=Login+CN=sts,O=Example"));
}

// Each of these would be the name if the reader were more lenient.
TEST(DistinguishedNameTest, IsNoNameWhenTheSyntaxIsWrong) {
  for (const char* text : {"",
                           " ",
                           ",",
                           "OU=Login+CN=sts,O=Example,",
                           ",OU=Login+CN=sts,O=Example",
                           "OU=Login+CN=sts,,O=Example",
                           "OU=Login++CN=sts,O=Example",
                           "OU=Login+CN=sts,O=Example+",
                           "OU=Login+CN sts,O=Example",
                           "/O=Example/OU=Login+CN=sts",
                           "OU=Login+=sts,O=Example",
                           "OU=Login+C N=sts,O=Example",
                           "OU=Login+CN=\"sts,O=Example",
                           "OU=Login+CN=\"sts\"x,O=Example",
                           "OU=Login+CN=s\"t\"s,O=Example",
                           "OU=Login+CN=<sts>,O=Example",
                           "OU=Login+CN=sts\\",
                           "OU=Login+CN=#,O=Example",
                           "OU=Login+CN=#0c0373747,O=Example",
                           "OU=Login+CN=#0c0373747g,O=Example",
                           "OU=Login+CN=#0c0473747,O=Example",
                           "OU=Login+CN=#0c04737473,O=Example",
                           "OU=Login+CN=#0c027374 73,O=Example",
                           "OU=Login+OID.CN=sts,O=Example",
                           "OU=Login+2.5.4.03=sts,O=Example",
                           "OU=Login+2.5.4.=sts,O=Example",
                           "OU=Login+2..5.4.3=sts,O=Example",
                           "OU=Login+.2.5.4.3=sts,O=Example",
                           "OU=Login+2 5 4 3=sts,O=Example",
                           "OU=Login+3.5.4.3=sts,O=Example",
                           "OU=Login+2=sts,O=Example",
                           "OU=Login+XYZ=sts,O=Example",
                           "OU=Login+undefined=sts,O=Example",
                           "sts",
                           "=",
                           "OU=Login+CN=\\ff,O=Example",
                           "OU=Login+CN=\\C3,O=Example",
                           "OU=Login+CN=\xC3,O=Example"}) {
    const auto name = DistinguishedName::FromText(text);
    EXPECT_FALSE(name.Equals(Example())) << text;
    EXPECT_FALSE(name.Equals(name)) << text;
  }
  const auto name = DistinguishedName::FromText("OU=Login+CN=sts,O=Example");
  EXPECT_TRUE(name.Equals(name));
}

TEST(DistinguishedNameTest, MayHoldANul) {
  const std::string zero("a\0b", 3);
  const auto name = NameOf({{"CN", V_ASN1_UTF8STRING, zero}});
  EXPECT_TRUE(DistinguishedName::FromText("CN=a\\00b").Equals(name));
  EXPECT_FALSE(DistinguishedName::FromText("CN=a").Equals(name));
  EXPECT_FALSE(DistinguishedName::FromText("CN=" + zero).Equals(name));
  EXPECT_FALSE(DistinguishedName::FromText("CN=\"" + zero + '"').Equals(name));
}

TEST(DistinguishedNameTest, DoesNotDependOnTheTypeOfTheString) {
  const auto text = DistinguishedName::FromText("CN=J\xC3\xBCrgen,DC=x");
  EXPECT_TRUE(
      NameOf({{"DC", V_ASN1_IA5STRING, "x"}, {"CN", V_ASN1_T61STRING, "J\xFCrgen"}}).Equals(text));
  EXPECT_TRUE(NameOf({{"DC", V_ASN1_PRINTABLESTRING, "x"},
                      {"CN", V_ASN1_BMPSTRING, std::string("\0J\0\xFC\0r\0g\0e\0n", 12)}})
                  .Equals(text));
  EXPECT_FALSE(
      NameOf({{"DC", V_ASN1_IA5STRING, "x"}, {"CN", V_ASN1_T61STRING, "Jurgen"}}).Equals(text));
}

TEST(DistinguishedNameTest, MayHoldBlanksThatDoNotMatter) {
  const auto name = NameOf({{"CN", V_ASN1_UTF8STRING, " a  b "}});
  for (const char* text : {"CN=a b", "CN=\\ a\\  b\\ ", "CN=\" a  b \"", "CN=   a    b   "}) {
    EXPECT_TRUE(DistinguishedName::FromText(text).Equals(name)) << text;
  }
  EXPECT_FALSE(DistinguishedName::FromText("CN=ab").Equals(name));
}

TEST(DistinguishedNameTest, MayHaveAnEmptyValue) {
  const auto name = NameOf({{"CN", V_ASN1_UTF8STRING, ""}, {"O", V_ASN1_UTF8STRING, "x"}});
  for (const char* text : {"O=x,CN=", "O=x, CN= ", "O=x,CN=\"\"", "O=x,CN=#0c00"}) {
    EXPECT_TRUE(DistinguishedName::FromText(text).Equals(name)) << text;
  }
  EXPECT_FALSE(DistinguishedName::FromText("O=x").Equals(name));
}

// In .NET a quotation mark is doubled and a reverse solidus is not; elsewhere both are escaped.
TEST(DistinguishedNameTest, MayHoldQuotationMarksAndReverseSolidi) {
  const auto name = NameOf({{"CN", V_ASN1_UTF8STRING, R"("a", b\s)"}});
  for (const char* text : {R"(CN="""a"", b\s")", R"(CN="\"a\", b\\s")", R"(CN=\"a\"\, b\\s)",
                           R"(CN=\"a\"\, b\s)", R"(CN=\22a\22\2C b\5Cs)"}) {
    EXPECT_TRUE(DistinguishedName::FromText(text).Equals(name)) << text;
  }
  for (const char* text : {R"(CN="a", b\s)", R"(CN=""a"", b\s)", R"(CN="""a"", b\")",
                           R"(CN=\"a\"\, b\\\s)", R"(CN=\"a\"\, bs)"}) {
    EXPECT_FALSE(DistinguishedName::FromText(text).Equals(name)) << text;
  }
}

TEST(DistinguishedNameTest, ThatIsEmptyEqualsNothing) {
  const OwnedName empty(X509_NAME_new());
  const DistinguishedName name(empty.get());
  EXPECT_FALSE(name.Equals(name));
  EXPECT_FALSE(name.Equals(DistinguishedName()));
  EXPECT_FALSE(DistinguishedName().Equals(DistinguishedName()));
  EXPECT_FALSE(DistinguishedName::FromText("").Equals(name));
}

TEST(DistinguishedNameTest, IsReadFromTextsOfLimitedLength) {
  const std::string start = "CN=";
  const std::string longest = start + std::string(DistinguishedName::kMaxText - start.size(), 'x');
  const auto name = DistinguishedName::FromText(longest);
  EXPECT_TRUE(name.Equals(name));
  const auto longer = DistinguishedName::FromText(longest + "x");
  EXPECT_FALSE(longer.Equals(longer));
}

TEST(DistinguishedNameTest, HasALimitedNumberOfAttributes) {
  std::string parts = "C=";
  for (int i = 1; i < Crypto::kMaxNameAttributes; ++i) {
    parts += i % 2 == 0 ? ",C=" : "+L=";
  }
  const auto most = DistinguishedName::FromText(parts);
  EXPECT_TRUE(most.Equals(most));
  for (const char* more : {",C=", "+L="}) {
    const auto tooMany = DistinguishedName::FromText(parts + more);
    EXPECT_FALSE(tooMany.Equals(tooMany)) << more;
  }
}

TEST(DistinguishedNameTest, LeavesTheErrorQueueUnchanged) {
  ERR_clear_error();
  DistinguishedName::FromText("CN=#ffff,2.999.99999999999999999999999999999999.1=\\ff,CN=\\ff");
  DistinguishedName::FromText("CN=#0500");
  DistinguishedName::FromText("XYZ=1");
  EXPECT_EQ(ERR_peek_error(), 0U);
}

}  // namespace
}  // namespace Tarnik::Testing
