#include <string>

#include <gtest/gtest.h>

#include <tarnik/core/reader.h>
#include <tarnik/core/writer.h>

namespace Tarnik::Testing {
namespace {

TEST(StringReaderTest, ReadsInPiecesToTheEnd) {
  const auto reader = CreateStringReader("abcdefg");
  char buffer[4];
  EXPECT_EQ(reader->Read(buffer, 4), 4U);
  EXPECT_EQ(std::string(buffer, 4), "abcd");
  EXPECT_EQ(reader->Read(buffer, 4), 3U);
  EXPECT_EQ(std::string(buffer, 3), "efg");
  EXPECT_EQ(reader->Read(buffer, 4), 0U);
  EXPECT_EQ(reader->Read(buffer, 4), 0U);
}

TEST(StringReaderTest, KeepsNulBytes) {
  const auto reader = CreateStringReader(std::string("a\0b", 3));
  char buffer[8];
  EXPECT_EQ(reader->Read(buffer, 8), 3U);
  EXPECT_EQ(std::string(buffer, 3), std::string("a\0b", 3));
}

TEST(StringReaderTest, EmptyTextEndsAtOnce) {
  char buffer[1];
  EXPECT_EQ(CreateStringReader("")->Read(buffer, 1), 0U);
}

TEST(StringWriterTest, CollectsAllThatIsWritten) {
  const auto writer = CreateStringWriter();
  std::string expected;
  for (int i = 0; i < 1000; ++i) {
    writer->Write("piece,");
    expected += "piece,";
  }
  EXPECT_EQ(writer->Text(), expected);
}

TEST(StringWriterTest, TakeTextLeavesItEmpty) {
  const auto writer = CreateStringWriter();
  writer->Write("short");
  EXPECT_EQ(writer->TakeText(), "short");
  EXPECT_EQ(writer->Text(), "");
  writer->Write("again");
  EXPECT_EQ(writer->Text(), "again");
}

}  // namespace
}  // namespace Tarnik::Testing
