#include "crypto/der_writer.h"

#include <string>

#include <gtest/gtest.h>

namespace Tarnik::Testing {
namespace {

using Crypto::DerOf;
using Crypto::DerOfBits;
using Crypto::DerOfNumber;
using Crypto::DerTag;
using std::string;

TEST(DerWriterTest, WritesLengthsInTheShortestForm) {
  EXPECT_EQ(DerOf(DerTag::kSequence, ""), string("\x30\x00", 2));
  EXPECT_EQ(DerOf(DerTag::kUtf8String, "ab"),
            "\x0C\x02"
            "ab");
  EXPECT_EQ(DerOf(DerTag::kSet, string(127, 'x')), "\x31\x7F" + string(127, 'x'));
  EXPECT_EQ(DerOf(DerTag::kSet, string(128, 'x')), "\x31\x81\x80" + string(128, 'x'));
  EXPECT_EQ(DerOf(DerTag::kSet, string(255, 'x')), "\x31\x81\xFF" + string(255, 'x'));
  EXPECT_EQ(DerOf(DerTag::kSet, string(256, 'x')),
            string("\x31\x82\x01\x00", 4) + string(256, 'x'));
  EXPECT_EQ(DerOf(DerTag::kSet, string(65536, 'x')).substr(0, 5),
            string("\x31\x83\x01\x00\x00", 5));
}

TEST(DerWriterTest, WritesNumbersWithoutASign) {
  EXPECT_EQ(DerOfNumber("\x01"), "\x02\x01\x01");
  EXPECT_EQ(DerOfNumber(string("\x00\x00\x01", 3)), "\x02\x01\x01");
  EXPECT_EQ(DerOfNumber("\x80"), string("\x02\x02\x00\x80", 4));
  EXPECT_EQ(DerOfNumber(string("\x00\x80", 2)), string("\x02\x02\x00\x80", 4));
  EXPECT_EQ(DerOfNumber(""), string("\x02\x01\x00", 3));
  EXPECT_EQ(DerOfNumber(string(2, '\0')), string("\x02\x01\x00", 3));
}

TEST(DerWriterTest, WritesBitStringsOfBytes) {
  EXPECT_EQ(DerOfBits("ab"), string("\x03\x03\x00"
                                    "ab",
                                    5));
}

}  // namespace
}  // namespace Tarnik::Testing
