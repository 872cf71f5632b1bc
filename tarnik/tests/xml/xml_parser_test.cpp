#include <algorithm>
#include <cstddef>
#include <stdexcept>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/reader.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/xml_parse_exception.h>
#include <tarnik/xml/xml_parser.h>

#include "support/xml_text.h"
#include "xml/parse_fault.h"
#include "xml/piece_reader.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;

struct ReadFailure {};

/// Returns a text and then fails.
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

/// Records the events that it receives and can fail at one of them.
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

TEST(XMLParserTest, ReportsEventsInDocumentOrderWithTheirPositions) {
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

TEST(XMLParserTest, ReportsPositionsBeyondTheFirstPiece) {
  std::string text = "<r>\n";
  for (int line = 0; line < 9000; ++line) {
    text += "<l a='\n'>some text</l>\n";
  }
  text += "  <wrong></r>";
  EXPECT_EQ(Fault(text), "mismatched tag at line 18002, column 12");
}

TEST(XMLParserTest, ReportsPositionsAfterTokensLongerThanAPiece) {
  const std::string filler(300000, '\n');
  EXPECT_EQ(Fault("<r><!--" + filler + "--> <wrong></r>"),
            "mismatched tag at line 300001, column 14");
}

TEST(XMLParserTest, ReadsDocumentsThatEndAroundTheEndOfAPiece) {
  for (const std::size_t pieces : {std::size_t{8192}, std::size_t{131072}, std::size_t{262144}}) {
    for (std::size_t size = pieces - 5; size <= pieces + 5; ++size) {
      const std::string text = "<a>" + std::string(size - 7, 'x');
      EXPECT_EQ(XmlText(ParseXml(text + "</a>").get()), text + "</a>") << size;
      EXPECT_EQ(Fault(text + "</b>"),
                "mismatched tag at line 1, column " + std::to_string(text.size() + 3))
          << size;
    }
  }
}

TEST(XMLParserTest, CanBeUsedOnlyOnce) {
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

TEST(XMLParserTest, PropagatesTheFailureOfTheReader) {
  for (const std::size_t length : {0, 3, 300000}) {
    const auto reader = MakeRef<FailingReader>("<a>" + std::string(length, 'x'));
    const Ref<XMLHandler> handler = CreateXMLDocumentHandler();
    EXPECT_THROW(CreateXMLParser(reader.get(), handler.get())->Parse(), ReadFailure);
  }
}

TEST(XMLParserTest, PropagatesTheFailureOfTheHandlerAndStops) {
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

TEST(XMLParserTest, ReportsNothingAfterTheHandlerHasFailed) {
  const Ref<Reader> reader = CreateStringReader("<a/>");
  const auto handler = MakeRef<RecordingHandler>();
  handler->failAt = "start a";
  EXPECT_THROW(CreateXMLParser(reader.get(), handler.get())->Parse(), std::runtime_error);
  EXPECT_THAT(handler->events, testing::ElementsAre("1:1 start a"));
}

TEST(XMLParserTest, AcceptsUtf8WithEveryFormOfDeclaration) {
  for (const char* start :
       {"", "\xEF\xBB\xBF", "<?xml version='1.0'?>", "<?xml version=\"1.0\" encoding=\"UTF-8\"?>",
        "<?xml version='1.0' encoding='utf-8' standalone='yes'?>",
        "\xEF\xBB\xBF<?xml version='1.0' encoding='Utf-8'?>\r\n"}) {
    const Ref<Document> document = ParseXml(std::string(start) + "<a>\xE2\x82\xAC</a>");
    EXPECT_EQ(XmlText(document->RootElement()), "<a>\xE2\x82\xAC</a>") << start;
  }
}

TEST(XMLParserTest, EnforcesTheLimitOfTheDocumentLength) {
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

TEST(XMLParserTest, RefusesADocumentTruncatedAtAnyByte) {
  const std::string text =
      "<?xml version='1.0' encoding='UTF-8'?><!--c--><?p d?><a:r xmlns:a='urn:a' x=\"1&amp;\">"
      "t&lt;\xC3\xA9<b/><![CDATA[<>]]><!-- d --><a:c y='&#13;'>z</a:c></a:r>";
  ASSERT_EQ(Fault(text), "");
  for (std::size_t length = 0; length < text.size(); ++length) {
    EXPECT_NE(Fault(text.substr(0, length)), "") << length;
  }
}

TEST(XMLParserTest, BuildsTheSameTreeFromPiecesOfAnySize) {
  std::string text = "<a:r xmlns:a='urn:a'>";
  for (int index = 0; index < 4000; ++index) {
    text += "<a:e n='" + std::to_string(index) + "'>t\xE2\x82\xAC&lt;\r\n<![CDATA[c]]></a:e>";
  }
  text += "</a:r>";
  const std::string whole = XmlText(ParseXml(text).get());
  for (const std::size_t piece : {1, 2, 7, 4096, 131071, 131072, 131073}) {
    EXPECT_EQ(XmlText(ParseXml(MakeRef<PieceReader>(text, piece).get()).get()), whole) << piece;
  }
}

}  // namespace
}  // namespace Tarnik::Testing
