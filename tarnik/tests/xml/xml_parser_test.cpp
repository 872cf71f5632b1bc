#include <tarnik/xml/xml_parser.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <ctime>
#include <stdexcept>
#include <string>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "support/xml_text.h"

namespace Tarnik::Xml {
namespace {

using TestSupport::ParseXml;
using TestSupport::XmlText;

std::string Fault(const std::string& text) {
  try {
    ParseXml(text);
  } catch (const XMLParseException& exception) {
    return exception.Message();
  }
  return "";
}

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

/// Gives a text in pieces of a fixed size.
class PieceReader final : public Reader, public ObjectImpl {
 public:
  PieceReader(std::string text, std::size_t piece) : text_(std::move(text)), piece_(piece) {}

  std::size_t Read(char* buffer, std::size_t size) override {
    const std::size_t count = std::min({size, piece_, text_.size() - position_});
    text_.copy(buffer, count, position_);
    position_ += count;
    return count;
  }

 private:
  std::string text_;
  std::size_t piece_;
  std::size_t position_ = 0;
};

struct ReadFailure {};

/// Gives a text and then fails.
class FailingReader final : public Reader, public ObjectImpl {
 public:
  explicit FailingReader(std::string text) : text_(std::move(text)) {}

  std::size_t Read(char* buffer, std::size_t size) override {
    if (text_.empty()) {
      throw ReadFailure();
    }
    const std::size_t count = text_.copy(buffer, size);
    text_.erase(0, count);
    return count;
  }

 private:
  std::string text_;
};

/// Writes down the events that it receives, and can fail at one of them.
class RecordingHandler final : public XMLHandler, public ObjectImpl {
 public:
  std::vector<std::string> events;
  std::string failAt;

  void StartElement(const Position& position, std::string_view name,
                    const ParsedAttribute* attributes, std::size_t count) override {
    std::string text = "start " + std::string(name);
    for (std::size_t index = 0; index < count; ++index) {
      text +=
          " " + std::string(attributes[index].name) + "=" + std::string(attributes[index].value);
    }
    Record(position, text);
  }
  void EndElement(const Position& position) override { Record(position, "end"); }
  void Characters(const Position&, std::string_view text) override {
    characters += text;
    Fail("text " + characters);
  }
  void Comment(const Position& position, std::string_view text) override {
    Record(position, "comment " + std::string(text));
  }
  void ProcessingInstruction(const Position& position, std::string_view target,
                             std::string_view text) override {
    Record(position, "pi " + std::string(target) + "|" + std::string(text));
  }
  Ref<Object> EndDocument() override {
    Fail("end of document");
    return Ref<Object>(this);
  }

  std::string characters;

 private:
  void Record(const Position& position, const std::string& event) {
    events.push_back(std::to_string(position.line) + ":" + std::to_string(position.column) + " " +
                     event);
    Fail(event);
  }
  void Fail(const std::string& event) const {
    if (event == failAt) {
      throw std::runtime_error(event);
    }
  }
};

TEST(XMLParserTest, ReportsEventsInDocumentOrderWithTheirPlaces) {
  const Ref<Reader> reader = CreateStringReader(
      "<?xml version='1.0'?>\n<!--c-->\n<r b='1' a='2'>\n  <e/>\xC3\xA9<f>x</f><?p d e?>\n</r>\n");
  const auto handler = MakeRef<RecordingHandler>();
  const Ref<Object> result = CreateXMLParser(reader.get(), handler.get())->Parse();
  EXPECT_EQ(result.get(), handler.get());
  EXPECT_THAT(handler->events,
              testing::ElementsAre("2:1 comment c", "3:1 start r b=1 a=2", "4:3 start e", "4:7 end",
                                   "4:9 start f", "4:13 end", "4:17 pi p|d e", "5:1 end"));
  EXPECT_EQ(handler->characters, "\n  \xC3\xA9x\n");
}

TEST(XMLParserTest, KeepsPlacesRightPastTheFirstChunk) {
  std::string text = "<r>\n";
  for (int line = 0; line < 9000; ++line) {
    text += "<l a='\n'>some text</l>\n";
  }
  text += "  <wrong></r>";
  EXPECT_EQ(Fault(text), "mismatched tag at line 18002, column 12");
}

TEST(XMLParserTest, KeepsPlacesRightInTokensLongerThanAChunk) {
  const std::string filler(70000, '\n');
  EXPECT_EQ(Fault("<r><!--" + filler + "--> <wrong></r>"),
            "mismatched tag at line 70001, column 14");
}

TEST(XMLParserTest, IsUsedOnce) {
  const Ref<Reader> reader = CreateStringReader("<a/>");
  const Ref<XMLHandler> handler = CreateXMLDocumentHandler();
  const Ref<XMLParser> parser = CreateXMLParser(reader.get(), handler.get());
  parser->Parse();
  EXPECT_THROW(parser->Parse(), InvalidStateException);
}

TEST(XMLParserTest, RefusesNullArguments) {
  const Ref<Reader> reader = CreateStringReader("<a/>");
  const Ref<XMLHandler> handler = CreateXMLDocumentHandler();
  EXPECT_THROW(CreateXMLParser(nullptr, handler.get()), InvalidArgumentException);
  EXPECT_THROW(CreateXMLParser(reader.get(), nullptr), InvalidArgumentException);
}

TEST(XMLParserTest, PassesTheFailureOfTheReaderThrough) {
  for (const std::size_t length : {0, 3, 70000}) {
    const auto reader = MakeRef<FailingReader>("<a>" + std::string(length, 'x'));
    const Ref<XMLHandler> handler = CreateXMLDocumentHandler();
    EXPECT_THROW(CreateXMLParser(reader.get(), handler.get())->Parse(), ReadFailure);
  }
}

TEST(XMLParserTest, PassesTheFailureOfTheHandlerThroughAndStops) {
  for (const char* event : {"start a", "end", "text t", "comment c", "pi p|d", "end of document"}) {
    const Ref<Reader> reader = CreateStringReader("<a>t<!--c--><?p d?></a>");
    const auto handler = MakeRef<RecordingHandler>();
    handler->failAt = event;
    try {
      CreateXMLParser(reader.get(), handler.get())->Parse();
      ADD_FAILURE() << event;
    } catch (const std::runtime_error& exception) {
      EXPECT_STREQ(exception.what(), event);
    }
  }
}

TEST(XMLParserTest, ReportsNothingMoreAfterTheHandlerFailed) {
  const Ref<Reader> reader = CreateStringReader("<a/>");
  const auto handler = MakeRef<RecordingHandler>();
  handler->failAt = "start a";
  EXPECT_THROW(CreateXMLParser(reader.get(), handler.get())->Parse(), std::runtime_error);
  EXPECT_THAT(handler->events, testing::ElementsAre("1:1 start a"));
}

struct FaultCase {
  const char* name;
  std::string text;
  std::string message;
};

void PrintTo(const FaultCase& fault, std::ostream* stream) {
  *stream << fault.name;
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
        FaultCase{"Version2", "<?xml version='2.0'?><a/>",
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
        FaultCase{"TextAlone", "text", "syntax error at line 1, column 1"},
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

TEST(XMLParserTest, AcceptsTheDeepestTree) {
  EXPECT_EQ(Fault(Nested(kMaxElementDepth)), "");
}

TEST(XMLParserTest, AcceptsUtf8HoweverItIsDeclared) {
  for (const char* start :
       {"", "\xEF\xBB\xBF", "<?xml version='1.0'?>", "<?xml version=\"1.0\" encoding=\"UTF-8\"?>",
        "<?xml version='1.0' encoding='utf-8' standalone='yes'?>",
        "\xEF\xBB\xBF<?xml version='1.0' encoding='Utf-8'?>\r\n"}) {
    const Ref<Document> document = ParseXml(std::string(start) + "<a>\xE2\x82\xAC</a>");
    EXPECT_EQ(XmlText(document->RootElement()), "<a>\xE2\x82\xAC</a>") << start;
  }
}

TEST(XMLParserTest, HoldsTheLimitOfTheDocumentsLength) {
  const std::string longest =
      "<a>" + std::string(kMaxDocumentBytes - std::string("<a></a>").size(), 'x') + "</a>";
  ASSERT_EQ(longest.size(), kMaxDocumentBytes);
  EXPECT_EQ(Fault(longest), "");
  EXPECT_THAT(Fault(longest + " "),
              testing::StartsWith("The document is longer than 16777216 bytes at line 1, column "));
}

TEST(XMLParserTest, StopsAnEndlessReaderAtTheLimit) {
  class EndlessReader final : public Reader, public ObjectImpl {
   public:
    std::size_t total = 0;
    std::size_t Read(char* buffer, std::size_t size) override {
      std::fill_n(buffer, size, ' ');
      total += size;
      return size;
    }
  };
  const auto reader = MakeRef<EndlessReader>();
  EXPECT_THROW(ParseXml(reader.get()), XMLParseException);
  EXPECT_LE(reader->total, 2 * kMaxDocumentBytes);
}

TEST(XMLParserTest, RefusesADocumentCutAtAnyByte) {
  const std::string text =
      "<?xml version='1.0' encoding='UTF-8'?><!--c--><?p d?><a:r xmlns:a='urn:a' x=\"1&amp;\">"
      "t&lt;\xC3\xA9<b/><![CDATA[<>]]><!-- d --><a:c y='&#13;'>z</a:c></a:r>";
  ASSERT_EQ(Fault(text), "");
  for (std::size_t length = 0; length < text.size(); ++length) {
    EXPECT_NE(Fault(text.substr(0, length)), "") << length;
  }
}

TEST(XMLParserTest, GivesTheSameTreeHoweverTheReaderCutsTheText) {
  std::string text = "<a:r xmlns:a='urn:a'>";
  for (int index = 0; index < 3000; ++index) {
    text += "<a:e n='" + std::to_string(index) + "'>t\xE2\x82\xAC&lt;\r\n<![CDATA[c]]></a:e>";
  }
  text += "</a:r>";
  const std::string whole = XmlText(ParseXml(text).get());
  for (const std::size_t piece : {1, 2, 7, 4096, 16383, 16384, 16385}) {
    EXPECT_EQ(XmlText(ParseXml(MakeRef<PieceReader>(text, piece).get()).get()), whole) << piece;
  }
}

// What a document begins with is looked at as a whole, even if the reader gives less.
TEST(XMLParserTest, RefusesUtf16HoweverTheReaderCutsTheText) {
  for (const std::string& text :
       {std::string("\xFF\xFE<\0a\0/\0>\0", 10), std::string("\xFE\xFF\0<\0a\0/\0>", 10),
        std::string("<\0a\0/\0>\0", 8), std::string("\0<\0a\0/\0>", 8)}) {
    for (const std::size_t piece : {1, 2, 3}) {
      try {
        ParseXml(MakeRef<PieceReader>(text, piece).get());
        ADD_FAILURE() << piece;
      } catch (const XMLParseException& exception) {
        EXPECT_EQ(exception.Message(), kUtf16Message);
      }
    }
  }
}

// Time of the processor, which other programs on the machine do not lengthen.
double SecondsToParse(const std::string& text, std::size_t piece) {
  double best = 1e9;
  for (int round = 0; round < 3; ++round) {
    const auto reader = MakeRef<PieceReader>(text, piece);
    const std::clock_t start = std::clock();
    try {
      ParseXml(reader.get());
    } catch (const XMLParseException&) {
      // A refusal must not take long, either.
    }
    best = std::min(best, static_cast<double>(std::clock() - start) / CLOCKS_PER_SEC);
  }
  return best;
}

std::string LongAttribute(std::size_t size) {
  return "<a x='" + std::string(size, 'v') + "'/>";
}

std::string ManyAttributes(std::size_t count) {
  std::string text = "<a xmlns:p='urn:p'";
  for (std::size_t index = 0; index < count; ++index) {
    text += (index % 2 == 0 ? " p:x" : " x") + std::to_string(index) + "='v'";
  }
  return text + "/>";
}

std::string ManyDeclarations(std::size_t count) {
  std::string declarations;
  std::string uses;
  for (std::size_t index = 0; index < count; ++index) {
    const std::string number = std::to_string(index);
    declarations += " xmlns:p" + number + "='urn:" + number + "'";
    uses += " p" + number + ":x='v'";
  }
  return "<a" + declarations + uses + "/>";
}

std::string ManyElements(std::size_t count) {
  std::string text = "<a>";
  for (std::size_t index = 0; index < count; ++index) {
    text += "<e i='" + std::to_string(index) + "'>x</e>\n";
  }
  return text + "</a>";
}

struct ScalingCase {
  const char* name;
  std::string (*make)(std::size_t);
  std::size_t size;
  std::size_t piece;
};

void PrintTo(const ScalingCase& scaling, std::ostream* stream) {
  *stream << scaling.name;
}

class XMLParserScalingTest : public testing::TestWithParam<ScalingCase> {};

// Eight times the size may take 32 times the time, which leaves room for caches and for sorting; a
// quadratic cost would take 64 times.
TEST_P(XMLParserScalingTest, TakesTimeInProportionToTheSize) {
  const ScalingCase& scaling = GetParam();
  const double small = SecondsToParse(scaling.make(scaling.size / 8), scaling.piece);
  const double large = SecondsToParse(scaling.make(scaling.size), scaling.piece);
  EXPECT_LT(large, 32 * std::max(small, 1e-3));
}

INSTANTIATE_TEST_SUITE_P(
    Shapes, XMLParserScalingTest,
    testing::Values(ScalingCase{"LongAttributeInSingleBytes", LongAttribute, 1 << 20, 1},
                    ScalingCase{"LongAttribute", LongAttribute, 8 << 20, 1 << 20},
                    ScalingCase{"ManyAttributes", ManyAttributes, 100000, 1 << 20},
                    ScalingCase{"ManyDeclarations", ManyDeclarations, 40000, 1 << 20},
                    ScalingCase{"ManyElements", ManyElements, 40000, 1 << 20}),
    [](const auto& test) { return test.param.name; });

}  // namespace
}  // namespace Tarnik::Xml
