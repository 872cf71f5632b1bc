#include "xml/xml_chars.h"

#include <cstddef>
#include <ios>
#include <string>

#include <gtest/gtest.h>
#include <libxml/chvalid.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;

// Encodes any number of up to 21 bits as UTF-8 with this many octets, even where that is not valid.
std::string Encoded(unsigned character, int octets) {
  if (octets == 1) {
    return {static_cast<char>(character)};
  }
  std::string text;
  for (int shift = 6 * (octets - 1); shift >= 0; shift -= 6) {
    text += static_cast<char>(0x80 | (character >> shift & 0x3F));
  }
  const unsigned mark = 0xFF00U >> octets;
  text[0] = static_cast<char>(static_cast<unsigned char>(text[0] & 0x3F) | (mark & 0xFF));
  return text;
}

int OctetsOf(unsigned character) {
  return character < 0x80 ? 1 : character < 0x800 ? 2 : character < 0x10000 ? 3 : 4;
}

TEST(XmlCharsTest, AcceptsExactlyTheCharactersOfXml) {
  for (unsigned character = 0; character <= 0x110FFF; ++character) {
    const std::string text = Encoded(character, OctetsOf(character));
    ASSERT_EQ(IsXmlText("a" + text + "b"), xmlIsCharQ(character) != 0) << std::hex << character;
  }
}

TEST(XmlCharsTest, ChecksEveryOctetAtEveryPosition) {
  constexpr std::size_t kLength = 27;
  for (int octet = 0; octet <= 0xFF; ++octet) {
    const bool isText = octet < 0x80 && xmlIsCharQ(static_cast<unsigned>(octet)) != 0;
    for (std::size_t position = 0; position < kLength; ++position) {
      std::string text(kLength, 'a');
      text[position] = static_cast<char>(octet);
      ASSERT_EQ(IsXmlText(text), isText) << octet << " at " << position;
    }
  }
}

TEST(XmlCharsTest, AcceptsLongCharactersAnywhereInLongTexts) {
  constexpr std::size_t kLength = 27;
  for (std::size_t position = 0; position <= kLength; ++position) {
    std::string text(kLength, '~');
    EXPECT_TRUE(IsXmlText(text.insert(position, "\xE2\x82\xAC\n"))) << position;
  }
}

TEST(XmlCharsTest, RefusesOverlongForms) {
  for (unsigned character = 0; character < 0x10000; ++character) {
    for (int octets = OctetsOf(character) + 1; octets <= 4; ++octets) {
      ASSERT_FALSE(IsXmlText(Encoded(character, octets))) << std::hex << character;
    }
  }
}

TEST(XmlCharsTest, RefusesBrokenSequences) {
  for (const char* text : {"\x80", "\xBF", "\xC3", "\xC3(", "\xE2\x82", "\xE2\x82(", "\xE2(\xA1",
                           "\xF0\x9F\x94", "\xF0\x9F\x94(", "\xF8\x88\x80\x80\x80",
                           "\xFC\x84\x80\x80\x80\x80", "\xFE", "\xFF", "\xC3\xA4\xA4"}) {
    EXPECT_FALSE(IsXmlText(text)) << text;
    EXPECT_FALSE(IsNCName(std::string("a") + text)) << text;
  }
  EXPECT_TRUE(IsXmlText(""));
  EXPECT_TRUE(IsXmlText("\xC3\xA4\xE2\x82\xAC\xF0\x9F\x94\x91"));
}

TEST(XmlCharsTest, NCNamesBeginWithALetterOrAnUnderscore) {
  for (const char* name : {"a", "_", "Z9", "a-b.c", "\xC3\xA4", "a\xC2\xB7", "\xE4\xB8\x80"}) {
    EXPECT_TRUE(IsNCName(name)) << name;
  }
  for (const char* name : {"", "-a", ".a", "9", "a:b", ":", "a b", "a\n", "\xC2\xB7", "\xC3\x97",
                           "a\xC3\x97", "a\xE2\x80\xA8", "\xF0\x90\x80\x80"}) {
    EXPECT_FALSE(IsNCName(name)) << name;
  }
}

TEST(XmlCharsTest, QualifiedNamesHaveAtMostOneColon) {
  for (const char* name : {"a", "a:b", "_:_"}) {
    EXPECT_TRUE(IsQualifiedName(name)) << name;
  }
  for (const char* name : {"", ":", "a:", ":a", "a:b:c", "a::b", "a:1", "1:a"}) {
    EXPECT_FALSE(IsQualifiedName(name)) << name;
  }
}

}  // namespace
}  // namespace Tarnik::Testing
