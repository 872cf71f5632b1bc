#include <algorithm>
#include <cstddef>
#include <limits>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/text/base64.h>
#include <tarnik/text/string_util.h>

#include "support/thrown_message.h"

namespace Tarnik::Testing {
namespace {

const unsigned char* BytesOf(const std::string& text) {
  return reinterpret_cast<const unsigned char*>(text.data());
}

/// Encodes into a buffer of `room` characters between sentinels.
std::string Encode(const std::string& bytes, std::size_t room) {
  std::string buffer(room + 2, '#');
  std::size_t written = 12345;
  Base64_Encode(BytesOf(bytes), bytes.size(), buffer.data() + 1, room, &written);
  EXPECT_EQ(buffer.front(), '#');
  EXPECT_EQ(buffer.substr(1 + written), std::string(room - written + 1, '#'));
  return buffer.substr(1, written);
}

struct Vector {
  const char* bytes;
  const char* text;
};

TEST(Base64Test, EncodesTheVectorsOfRfc4648) {
  for (const Vector& vector :
       {Vector{"", ""}, Vector{"f", "Zg=="}, Vector{"fo", "Zm8="}, Vector{"foo", "Zm9v"},
        Vector{"foob", "Zm9vYg=="}, Vector{"fooba", "Zm9vYmE="}, Vector{"foobar", "Zm9vYmFy"}}) {
    const std::string bytes = vector.bytes;
    const std::size_t length = Base64_EncodedLength(BytesOf(bytes), bytes.size());
    EXPECT_EQ(length, std::string(vector.text).size());
    EXPECT_EQ(Encode(bytes, length), vector.text);
    EXPECT_EQ(Encode(bytes, length + 7), vector.text);
  }
}

TEST(Base64Test, WritesLongTextsOnOneLine) {
  for (const std::size_t size : {48U, 49U, 3U << 20, (3U << 20) + 1}) {
    std::string bytes(size, '\0');
    for (std::size_t i = 0; i < size; ++i) {
      bytes[i] = static_cast<char>(i * 7);
    }
    const std::string text = Encode(bytes, Base64_EncodedLength(BytesOf(bytes), size));
    EXPECT_EQ(text.find_first_of("\r\n"), std::string::npos);
    std::vector<unsigned char> decoded;
    StringUtil::Base64Decode(text, decoded);
    EXPECT_TRUE(std::equal(decoded.begin(), decoded.end(), BytesOf(bytes), BytesOf(bytes) + size));
  }
}

TEST(Base64Test, WritesNothingToABufferThatIsTooSmall) {
  std::string buffer(8, '#');
  std::size_t written = 12345;
  EXPECT_THROW(Base64_Encode(BytesOf("foobar"), 6, buffer.data(), 7, &written),
               InvalidArgumentException);
  EXPECT_EQ(buffer, "########");
  EXPECT_EQ(written, 12345U);
  EXPECT_THROW(Base64_Encode(BytesOf("foobar"), 6, nullptr, 8, &written), InvalidArgumentException);
  EXPECT_THROW(Base64_Encode(BytesOf("foobar"), 6, buffer.data(), 8, nullptr),
               InvalidArgumentException);
  EXPECT_EQ(buffer, "########");
}

TEST(Base64Test, ReportsTheRoomThatItNeeds) {
  std::size_t written = 0;
  EXPECT_EQ(ThrownMessage<InvalidArgumentException>(
                [&] { Base64_Encode(BytesOf("foobar"), 6, nullptr, 0, &written); }),
            "There is no room for a Base64 text of 8 characters.");
}

TEST(Base64Test, RefusesNullAndTooManyBytes) {
  EXPECT_EQ(Base64_EncodedLength(nullptr, 0), 0U);
  EXPECT_THROW(Base64_EncodedLength(nullptr, 1), InvalidArgumentException);
  constexpr std::size_t kMax = std::numeric_limits<std::size_t>::max();
  EXPECT_EQ(Base64_EncodedLength(BytesOf("x"), kMax / 4 * 3), kMax / 4 * 4);
  EXPECT_THROW(Base64_EncodedLength(BytesOf("x"), kMax / 4 * 3 + 1), InvalidArgumentException);
  EXPECT_THROW(Base64_EncodedLength(BytesOf("x"), kMax), InvalidArgumentException);
}

}  // namespace
}  // namespace Tarnik::Testing
