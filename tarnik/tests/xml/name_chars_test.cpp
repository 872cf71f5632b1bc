#include "xml/name_chars.h"

#include <cstddef>
#include <ios>
#include <sstream>
#include <string>

#include <gtest/gtest.h>
#include <libxml/chvalid.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/writer.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/xml_parse_exception.h>
#include <tarnik/xml/xml_writer.h>

#include "support/xml_text.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;

constexpr char32_t kFirst = 1;
constexpr char32_t kLast = 0x10FFFF;
constexpr char32_t kLastInNames = 0xFFFF;

std::string Hex(char32_t character) {
  std::ostringstream text;
  text << std::hex << static_cast<unsigned>(character);
  return text.str();
}

bool IsSurrogate(char32_t character) {
  return character >= 0xD800 && character <= 0xDFFF;
}

std::string Utf8(char32_t character) {
  const auto tail = [character](int shift) {
    return static_cast<char>(0x80 | (character >> shift & 0x3F));
  };
  if (character < 0x80) {
    return {static_cast<char>(character)};
  }
  if (character < 0x800) {
    return {static_cast<char>(0xC0 | character >> 6), tail(0)};
  }
  if (character < 0x10000) {
    return {static_cast<char>(0xE0 | character >> 12), tail(6), tail(0)};
  }
  return {static_cast<char>(0xF0 | character >> 18), tail(12), tail(6), tail(0)};
}

bool Parses(const std::string& name) {
  try {
    ParseXml("<" + name + "/>");
    return true;
  } catch (const XMLParseException&) {
    return false;
  }
}

bool CanBeBuilt(const std::string& name) {
  Ref<ElementNode> element;
  try {
    CreateElementNode("", name, element);
    return true;
  } catch (const InvalidArgumentException&) {
    return false;
  }
}

// The tables of the fourth edition in libxml2, which its own parser uses only on request.
TEST(NameCharsTest, AreThoseOfTheFourthEdition) {
  for (char32_t character = kFirst; character <= kLast; ++character) {
    const bool isStart =
        character == '_' || xmlIsBaseCharQ(character) != 0 || xmlIsIdeographicQ(character) != 0;
    const bool isOther = character == '-' || character == '.' || xmlIsDigitQ(character) != 0 ||
                         xmlIsCombiningQ(character) != 0 || xmlIsExtenderQ(character) != 0;
    // An assertion for each of a million characters would take most of the time.
    if (IsNameStart(character) != isStart || IsNameCharacter(character) != (isStart || isOther)) {
      FAIL() << Hex(character);
    }
  }
}

TEST(NameCharsTest, CanAllBeReadByTheParser) {
  std::string text = "<r>";
  std::size_t count = 0;
  for (char32_t character = kFirst; character <= kLastInNames; ++character) {
    if (IsNameStart(character)) {
      text.append("<").append(Utf8(character)).append("/>");
      ++count;
    } else if (IsNameCharacter(character)) {
      text.append("<_").append(Utf8(character)).append("/>");
      ++count;
    }
  }
  const auto document = ParseXml(text + "</r>");
  std::size_t read = 0;
  for (const Node* node = document->RootElement()->FirstChild(); node != nullptr;
       node = node->NextSibling()) {
    ++read;
  }
  EXPECT_EQ(read, count);
  EXPECT_GT(count, 30'000U);
}

// Around each end of a range: a name that can be built can be read, and the other way round.
TEST(NameCharsTest, AreTheOnlyOnesThatTheParserReads) {
  for (char32_t character = 0x7F; character <= 0x10001; ++character) {
    const bool isEnd = IsNameStart(character) != IsNameStart(character - 1) ||
                       IsNameCharacter(character) != IsNameCharacter(character - 1) ||
                       IsNameStart(character) != IsNameStart(character + 1) ||
                       IsNameCharacter(character) != IsNameCharacter(character + 1);
    if (IsSurrogate(character) || (!isEnd && character < 0xFFF0)) {
      continue;
    }
    for (const std::string& name : {Utf8(character), "_" + Utf8(character)}) {
      ASSERT_EQ(CanBeBuilt(name), Parses(name)) << Hex(character);
    }
  }
}

// U+0220, U+2C00 and U+10000 became letters in the fifth edition.
TEST(NameCharsTest, OfTheFifthEditionOnlyAreRefusedEverywhere) {
  Ref<ElementNode> element;
  CreateElementNode("p", "\xC3\xA4\xE4\xB8\x80\xC2\xB7", element);
  for (const char32_t character : {char32_t{0x220}, char32_t{0x2C00}, char32_t{0x10000}}) {
    const std::string name = Utf8(character);
    EXPECT_FALSE(Parses(name)) << name;
    Ref<ElementNode> other;
    EXPECT_THROW(CreateElementNode("", name, other), InvalidArgumentException) << name;
    EXPECT_THROW(CreateElementNode(name, "a", other), InvalidArgumentException) << name;
    EXPECT_THROW(element->SetAttribute(name, ""), InvalidArgumentException) << name;
    EXPECT_THROW(element->SetAttribute("a:a" + name, ""), InvalidArgumentException) << name;
    EXPECT_THROW(element->SetAttribute("xmlns:" + name, "urn:x"), InvalidArgumentException) << name;
  }
}

TEST(NameCharsTest, OfBuiltElementsAreReadBack) {
  Ref<ElementNode> element;
  CreateElementNode("", "\xC3\xA4\xE4\xB8\x80\xC2\xB7", element);
  element->SetAttribute("\xD0\xB6.-1", "v");
  const auto writer = CreateStringWriter();
  WriteXml(element.get(), writer.get());
  const auto document = ParseXml(writer->Text());
  EXPECT_EQ(document->RootElement()->LocalName(), element->LocalName());
  EXPECT_EQ(document->RootElement()->FindAttribute("\xD0\xB6.-1"), "v");
}

}  // namespace
}  // namespace Tarnik::Testing
