#include <cstddef>
#include <string>

#include <expat.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/object_impl.h>
#include <tarnik/xml/xml_parse_exception.h>
#include <tarnik/xml/xml_parser.h>

#include "support/thrown_message.h"
#include "support/xml_text.h"
#include "xml/parse_fault.h"
#include "xml/piece_reader.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;

std::string Nested(std::size_t depth) {
  std::string text;
  for (std::size_t level = 0; level < depth; ++level) {
    text += "<a>";
  }
  for (std::size_t level = 0; level < depth; ++level) {
    text += "</a>";
  }
  return text;
}

class XMLParserFaultTest : public testing::TestWithParam<FaultCase> {};

TEST_P(XMLParserFaultTest, IsRefusedWithItsMessage) {
  EXPECT_EQ(Fault(GetParam().text), GetParam().message);
}

constexpr const char* kDoctypeMessage =
    "The document holds a DOCTYPE, which is not accepted at line 1, column ";
constexpr const char* kEncodingMessage =
    "The document declares an encoding other than UTF-8 at line 1, column 1";
constexpr const char* kUtf16Message =
    "The document is in UTF-16 or UTF-32; only UTF-8 is accepted at line 1, column 1";
constexpr const char* kTokenMessage = "not well-formed (invalid token) at line 1, column ";

INSTANTIATE_TEST_SUITE_P(
    Doctype, XMLParserFaultTest,
    testing::Values(FaultCase{"Bare", "<!DOCTYPE a><a/>", std::string(kDoctypeMessage) + "12"},
                    FaultCase{"External", "<!DOCTYPE a SYSTEM 'file:///etc/passwd'><a/>",
                              std::string(kDoctypeMessage) + "40"},
                    FaultCase{"Public", "<!DOCTYPE a PUBLIC 'x' 'http://x.example/'><a/>",
                              std::string(kDoctypeMessage) + "43"},
                    FaultCase{"Entity", "<!DOCTYPE a [<!ENTITY e 'x'>]><a>&e;</a>",
                              std::string(kDoctypeMessage) + "13"},
                    FaultCase{"ParameterEntity", "<!DOCTYPE a [<!ENTITY % e 'x'> %e;]><a/>",
                              std::string(kDoctypeMessage) + "13"},
                    FaultCase{"Attlist", "<!DOCTYPE a [<!ATTLIST a ID CDATA 'x'>]><a/>",
                              std::string(kDoctypeMessage) + "13"}),
    [](const auto& test) { return test.param.name; });

INSTANTIATE_TEST_SUITE_P(
    Encoding, XMLParserFaultTest,
    testing::Values(
        FaultCase{"Latin1", "<?xml version='1.0' encoding='ISO-8859-1'?><a/>", kEncodingMessage},
        FaultCase{"Utf7", "<?xml version='1.0' encoding='UTF-7'?><a/>", kEncodingMessage},
        FaultCase{"Utf16Declared", "<?xml version='1.0' encoding='UTF-16'?><a/>", kEncodingMessage},
        FaultCase{"Ascii", "<?xml version='1.0' encoding='US-ASCII'?><a/>", kEncodingMessage},
        FaultCase{"BomAgainstDeclaration",
                  "\xEF\xBB\xBF<?xml version='1.0' encoding='UTF-16'?><a/>",
                  "The document declares an encoding other than UTF-8 at line 1, column 4"},
        FaultCase{"Utf16LittleEndianMark", std::string("\xFF\xFE<\0a\0/\0>\0", 10), kUtf16Message},
        FaultCase{"Utf16BigEndianMark", std::string("\xFE\xFF\0<\0a\0/\0>", 10), kUtf16Message},
        FaultCase{"Utf16LittleEndian", std::string("<\0a\0/\0>\0", 8), kUtf16Message},
        FaultCase{"Utf16BigEndian", std::string("\0<\0a\0/\0>", 8), kUtf16Message},
        FaultCase{"Utf32", std::string("\0\0\xFE\xFF\0\0\0<", 8), kUtf16Message},
        FaultCase{"Version11", "<?xml version='1.1'?><a/>",
                  "The document is not XML 1.0 at line 1, column 1"},
        FaultCase{"Version12", "<?xml version='1.2'?><a/>",
                  "The document is not XML 1.0 at line 1, column 1"}),
    [](const auto& test) { return test.param.name; });

INSTANTIATE_TEST_SUITE_P(
    Characters, XMLParserFaultTest,
    testing::Values(
        FaultCase{"OverlongTwoBytes", "<a>\xC0\xAF</a>", std::string(kTokenMessage) + "4"},
        FaultCase{"OverlongThreeBytes", "<a>\xE0\x80\xAF</a>", std::string(kTokenMessage) + "4"},
        FaultCase{"OverlongFourBytes", "<a>\xF0\x80\x80\xAF</a>", std::string(kTokenMessage) + "4"},
        FaultCase{"Surrogate", "<a>\xED\xA0\x80</a>", std::string(kTokenMessage) + "4"},
        FaultCase{"SurrogatePair", "<a>\xED\xA0\xBD\xED\xB8\x80</a>",
                  std::string(kTokenMessage) + "4"},
        FaultCase{"AboveUnicode", "<a>\xF4\x90\x80\x80</a>", std::string(kTokenMessage) + "4"},
        FaultCase{"LoneContinuation", "<a>x\x80</a>", std::string(kTokenMessage) + "5"},
        FaultCase{"CutSequence", "<a>\xC3</a>", std::string(kTokenMessage) + "4"},
        FaultCase{"Nul", std::string("<a>x\0</a>", 9), std::string(kTokenMessage) + "5"},
        FaultCase{"Control", "<a>\x01</a>", std::string(kTokenMessage) + "4"},
        FaultCase{"NonCharacterFffe", "<a>\xEF\xBF\xBE</a>", std::string(kTokenMessage) + "4"},
        FaultCase{"NonCharacterFfff", "<a>\xEF\xBF\xBF</a>", std::string(kTokenMessage) + "4"},
        FaultCase{"ReferenceToNul", "<a>&#0;</a>",
                  "reference to invalid character number at line 1, column 4"},
        FaultCase{"ReferenceToSurrogate", "<a>&#xD800;</a>",
                  "reference to invalid character number at line 1, column 4"},
        FaultCase{"ReferenceToFffe", "<a>&#xFFFE;</a>",
                  "reference to invalid character number at line 1, column 4"},
        FaultCase{"ReferenceAboveUnicode", "<a>&#x110000;</a>",
                  "reference to invalid character number at line 1, column 4"}),
    [](const auto& test) { return test.param.name; });

INSTANTIATE_TEST_SUITE_P(
    Form, XMLParserFaultTest,
    testing::Values(
        FaultCase{"Empty", "", "no element found at line 1, column 1"},
        FaultCase{"OnlyBlanks", " \n", "no element found at line 2, column 1"},
        FaultCase{"OnlyText", "text", "syntax error at line 1, column 1"},
        FaultCase{"TwoRoots", "<a/><b/>", "junk after document element at line 1, column 5"},
        FaultCase{"TextAfterRoot", "<a/>x", "junk after document element at line 1, column 5"},
        FaultCase{"Mismatch", "<a>\n <b></a>", "mismatched tag at line 2, column 7"},
        FaultCase{"Unclosed", "<a>", "no element found at line 1, column 4"},
        FaultCase{"SameAttributeTwice", "<a x='1' x='2'/>",
                  "duplicate attribute at line 1, column 10"},
        FaultCase{"UndefinedEntity", "<a>&e;</a>", "undefined entity at line 1, column 4"},
        FaultCase{"MarkupInAttribute", "<a x='<'/>", std::string(kTokenMessage) + "7"},
        FaultCase{"CdataEndInText", "<a>]]></a>", std::string(kTokenMessage) + "6"},
        FaultCase{"LateDeclaration", " <?xml version='1.0'?><a/>",
                  "XML or text declaration not at start of entity at line 1, column 2"}),
    [](const auto& test) { return test.param.name; });

INSTANTIATE_TEST_SUITE_P(
    Depth, XMLParserFaultTest,
    testing::Values(FaultCase{"OneTooMany", Nested(kMaxElementDepth + 1),
                              "Elements nest deeper than 256 at line 1, column 769"},
                    FaultCase{"HundredThousand", Nested(100000),
                              "Elements nest deeper than 256 at line 1, column 769"}),
    [](const auto& test) { return test.param.name; });

// Newer versions of Expat check the number themselves (XML 1.0, production 26).
TEST(XMLParserTest, RefusesAnotherMajorVersion) {
  const std::string ofExpat = XML_ErrorString(XML_ERROR_XML_DECL);
  EXPECT_THAT(Fault("<?xml version='2.0'?><a/>"),
              testing::AnyOf("The document is not XML 1.0 at line 1, column 1",
                             ofExpat + " at line 1, column 16"));
}

TEST(XMLParserTest, AcceptsTheDeepestTree) {
  EXPECT_EQ(Fault(Nested(kMaxElementDepth)), "");
}

// The encoding is detected from the first bytes, even if the reader returns fewer at first.
TEST(XMLParserTest, RefusesUtf16InPiecesOfAnySize) {
  for (const std::string& text :
       {std::string("\xFF\xFE<\0a\0/\0>\0", 10), std::string("\xFE\xFF\0<\0a\0/\0>", 10),
        std::string("<\0a\0/\0>\0", 8), std::string("\0<\0a\0/\0>", 8)}) {
    for (const std::size_t piece : {1, 2, 3}) {
      EXPECT_EQ(ThrownMessage<XMLParseException>(
                    [&] { ParseXml(MakeRef<PieceReader>(text, piece).get()); }),
                kUtf16Message)
          << piece;
    }
  }
}

}  // namespace
}  // namespace Tarnik::Testing
