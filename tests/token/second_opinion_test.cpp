#include <ssoclient/saml_token.h>

#include <devsts/xml_security.h>

#include <array>
#include <chrono>
#include <random>

#include "support/assertion_text.h"
#include "support/forgeries.h"

// Whatever a resolver lets through, an independent reader of XML signatures lets through, too: over
// signed assertions of every kind, edited at random.
namespace SsoClient {
namespace {

using TestSupport::AssertionText;

constexpr std::chrono::seconds kTime{4};

class Generator {
 public:
  explicit Generator(unsigned seed) : random_(seed) {}

  /// A number below `bound`.
  std::size_t Below(std::size_t bound) {
    return std::uniform_int_distribution<std::size_t>(0, bound - 1)(random_);
  }

  std::string SignedXml() {
    DevSts::SignOptions options;
    options.digest = static_cast<DevSts::DigestAlgorithm>(Below(3));
    options.canonicalization = static_cast<DevSts::CanonicalMode>(Below(4));
    options.keyInfo =
        Below(2) == 0 ? DevSts::KeyInfoContent::X509Data : DevSts::KeyInfoContent::None;
    if (Below(3) == 0) {
      options.inclusivePrefixes = {"xs", "rsa", "#default"};
    }
    AssertionText text;
    if (Below(2) == 0) {
      text.Delegate();
    }
    if (Below(3) == 0) {
      text.conditions += "\r\n\t<!-- a comment -->&#10;";
    }
    return text.ToSignedXml(TestSupport::TrustedCredential(), options);
  }

  void Edit(std::string& xml) {
    switch (Below(6)) {
      case 0:
        xml[Below(xml.size())] = static_cast<char>(Below(256));
        return;
      case 1:
        xml.erase(Below(xml.size()), 1 + Below(8));
        return;
      case 2: {
        const std::string piece = xml.substr(Below(xml.size()), 1 + Below(40));
        xml.insert(Below(xml.size()), piece);
        return;
      }
      case 3:
        xml.insert(Below(xml.size()), Snippet());
        return;
      default:
        InsertAtTag(xml);
    }
  }

 private:
  // What a canonical form may or may not see.
  std::string Snippet() {
    static constexpr std::array kSnippets{" ",
                                          "\t",
                                          "\r\n",
                                          "\n",
                                          "&#13;",
                                          "&#xA;",
                                          "&#x9;",
                                          "&#32;",
                                          "&amp;",
                                          "<!---->",
                                          "<!--x-->",
                                          "<?x y?>",
                                          "<![CDATA[]]>",
                                          "<![CDATA[ ]]>",
                                          "<![CDATA[a]]>",
                                          "<x/>",
                                          "<x ID=\"_a1\"/>",
                                          "<x xmlns=\"\"/>",
                                          " xmlns:q=\"urn:q\"",
                                          " xmlns=\"urn:q\"",
                                          " xmlns=\"\"",
                                          " xmlns:ds=\"urn:q\"",
                                          " xml:lang=\"en\"",
                                          " xml:space=\"preserve\"",
                                          " xml:id=\"x\"",
                                          " Id=\"x\"",
                                          " xmlns:xml=\"http://www.w3.org/XML/1998/namespace\"",
                                          "\xEF\xBB\xBF",
                                          "<?xml version=\"1.0\"?>",
                                          "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n",
                                          "\xC2\x85",
                                          "\xE2\x80\xA8",
                                          "=",
                                          "A",
                                          "ds:",
                                          " URI=\"\"",
                                          "#",
                                          "<!DOCTYPE a>"};
    return kSnippets[Below(kSnippets.size())];
  }

  // Behind a tag, inside of its end, or at either end of the text: where edits may be harmless.
  void InsertAtTag(std::string& xml) {
    const std::size_t from = Below(xml.size() + 1);
    const std::size_t tag = xml.find('>', from);
    if (tag == std::string::npos) {
      xml.insert(Below(2) == 0 ? 0 : xml.size(), Snippet());
      return;
    }
    std::size_t place = Below(2) == 0 ? tag + 1 : tag;
    if (place == tag && tag > 0 && xml[tag - 1] == '/') {
      --place;
    }
    xml.insert(place, Snippet());
  }

  std::mt19937 random_;
};

bool IsAccepted(const std::string& xml) {
  static const auto resolver = TestSupport::TrustedResolver();
  try {
    CreateSamlToken(xml, resolver.get());
    return true;
  } catch (const Tarnik::Exception&) {
    return false;
  }
}

TEST(SecondOpinion, IsGoodOfWhateverIsAccepted) {
  const unsigned seed = std::random_device()();
  SCOPED_TRACE("seed " + std::to_string(seed));
  Generator generator(seed);
  const auto end = std::chrono::steady_clock::now() + kTime;
  std::size_t accepted = 0;
  std::size_t refused = 0;
  for (std::string original; std::chrono::steady_clock::now() < end;) {
    if ((accepted + refused) % 64 == 0) {
      original = generator.SignedXml();
      ASSERT_TRUE(IsAccepted(original)) << original;
    }
    std::string xml = original;
    for (std::size_t edits = 1 + generator.Below(3); edits > 0; --edits) {
      generator.Edit(xml);
    }
    if (!IsAccepted(xml)) {
      ++refused;
      continue;
    }
    ++accepted;
    const DevSts::VerifyResult opinion =
        DevSts::VerifyXml(xml, TestSupport::TrustedCredential().certificatePem);
    // The other parser has rules of its own for the URIs of namespaces, which XML leaves free.
    const bool isOfItsParser = opinion.reason.find("is not a valid URI") != std::string::npos;
    ASSERT_TRUE(opinion || isOfItsParser) << opinion.reason << "\n" << xml;
  }
  // The edits are neither all harmless nor all fatal.
  EXPECT_GT(accepted, 0U);
  EXPECT_GT(refused, 0U);
}

// The twin: the second opinion does not say yes to everything.
TEST(SecondOpinion, IsBadOfATamperedAssertion) {
  const std::string xml =
      TestSupport::Replaced(TestSupport::OriginalAssertion(), "alice@", "admin@");
  EXPECT_FALSE(IsAccepted(xml));
  EXPECT_FALSE(DevSts::VerifyXml(xml, TestSupport::TrustedCredential().certificatePem));
}

}  // namespace
}  // namespace SsoClient
