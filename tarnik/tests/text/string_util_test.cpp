#include <cstddef>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/text/string_util.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::StringUtil;
using Bytes = std::vector<unsigned char>;

Bytes ToBytes(std::string_view text) {
  return {text.begin(), text.end()};
}

TEST(StringUtilBase64Test, EncodesTheTestVectorsOfRfc4648) {
  EXPECT_EQ(Base64Encode({}), "");
  EXPECT_EQ(Base64Encode(ToBytes("f")), "Zg==");
  EXPECT_EQ(Base64Encode(ToBytes("fo")), "Zm8=");
  EXPECT_EQ(Base64Encode(ToBytes("foo")), "Zm9v");
  EXPECT_EQ(Base64Encode(ToBytes("foob")), "Zm9vYg==");
  EXPECT_EQ(Base64Encode(ToBytes("fooba")), "Zm9vYmE=");
  EXPECT_EQ(Base64Encode(ToBytes("foobar")), "Zm9vYmFy");
}

TEST(StringUtilBase64Test, DecodesWhatItEncodesAtEveryLength) {
  for (std::size_t length = 0; length < 200; ++length) {
    Bytes bytes(length);
    for (std::size_t i = 0; i < length; ++i) {
      bytes[i] = static_cast<unsigned char>(i * 37 + length);
    }
    Bytes decoded = {1, 2, 3};
    Base64Decode(Base64Encode(bytes), decoded);
    EXPECT_EQ(decoded, bytes);
  }
}

TEST(StringUtilBase64Test, DecodesInputsOfSeveralPieces) {
  Bytes bytes((std::size_t{3} << 20) * 2 + 5, 0xA7);
  Bytes decoded;
  Base64Decode(Base64Encode(bytes), decoded);
  EXPECT_EQ(decoded, bytes);
}

TEST(StringUtilBase64Test, SkipsWhiteSpaceAnywhere) {
  Bytes decoded;
  Base64Decode(" Zm9v\r\n\tYm Fy ", decoded);
  EXPECT_EQ(decoded, ToBytes("foobar"));
}

TEST(StringUtilBase64Test, OnlyWhiteSpaceDecodesToNothing) {
  Bytes decoded = {1};
  Base64Decode(" \n", decoded);
  EXPECT_TRUE(decoded.empty());
}

class StringUtilBase64RefusalTest : public testing::TestWithParam<std::string> {};

TEST_P(StringUtilBase64RefusalTest, LeavesTheOutputUnchanged) {
  Bytes decoded = {9};
  EXPECT_THROW(Base64Decode(GetParam(), decoded), Base64FormatException);
  EXPECT_EQ(decoded, Bytes{9});
}

INSTANTIATE_TEST_SUITE_P(Texts, StringUtilBase64RefusalTest,
                         testing::Values("Z", "Zg", "Zg=", "Zg===", "=", "====", "Zm9v=", "Zm=v",
                                         "Z===", "Zh==", "Zm9=", "Zm9-", "Zm9_", "Zm9v\x80",
                                         std::string("Zm9\0", 4), "Zg==Zg==", "Zm9v!", "Zm9v\v"));

TEST(GenerateUuidTest, ReturnsRandomUuidsOfVersion4) {
  std::set<std::string> seen;
  for (int i = 0; i < 1000; ++i) {
    const std::string uuid = GenerateUuid();
    EXPECT_THAT(uuid, testing::MatchesRegex("[0-9a-f]{8}-[0-9a-f]{4}-4[0-9a-f]{3}-"
                                            "[89ab][0-9a-f]{3}-[0-9a-f]{12}"));
    EXPECT_TRUE(seen.insert(uuid).second);
  }
}

TEST(ToLowerTest, ChangesOnlyAsciiLetters) {
  EXPECT_EQ(ToLower("AbZ[@`\xC3\x84 09"), "abz[@`\xC3\x84 09");
}

TEST(CleanseTest, OverwritesBytesToTheEndOfTheirMemory) {
  std::vector<unsigned char> bytes(500, 's');
  const unsigned char* memory = bytes.data();
  bytes.resize(300);
  Cleanse(bytes);
  EXPECT_TRUE(bytes.empty());
  EXPECT_EQ(bytes.data(), memory);
  bytes.resize(300, 0);
  EXPECT_EQ(memory[0], 0);
  EXPECT_EQ(memory[299], 0);
  std::vector<unsigned char> empty;
  Cleanse(empty);
  EXPECT_EQ(empty.capacity(), 0U);
}

TEST(CleanseTest, OverwritesShortAndLongTexts) {
  for (const std::size_t length : {std::size_t{5}, std::size_t{500}}) {
    std::string text(length, 's');
    const char* bytes = text.data();
    Cleanse(text);
    EXPECT_TRUE(text.empty());
    EXPECT_EQ(bytes, text.data());
    EXPECT_EQ(text.capacity() >= length ? bytes[1] : 's', '\0');
  }
}

}  // namespace
}  // namespace Tarnik::Testing
