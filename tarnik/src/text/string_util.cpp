#include <tarnik/text/string_util.h>

#include <openssl/crypto.h>
#include <openssl/evp.h>
#include <boost/uuid/random_generator.hpp>
#include <boost/uuid/uuid_io.hpp>

#include <algorithm>
#include <array>
#include <cstddef>

#include <tarnik/core/exception.h>
#include <tarnik/text/base64.h>

namespace Tarnik::StringUtil {
namespace {

// OpenSSL counts in int: longer inputs go in pieces that end on a whole group.
constexpr std::size_t kDecodePiece = std::size_t{4} << 20;
constexpr std::string_view kAlphabet =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

const unsigned char* AsBytes(const char* text) {
  return reinterpret_cast<const unsigned char*>(text);
}

std::array<bool, 256> MakeAlphabetTable() {
  std::array<bool, 256> table{};
  for (const char letter : kAlphabet) {
    table[static_cast<unsigned char>(letter)] = true;
  }
  return table;
}

bool IsWhiteSpace(char c) {
  return c == ' ' || c == '\n' || c == '\r' || c == '\t';
}

std::string WithoutWhiteSpace(std::string_view text) {
  std::string result;
  result.reserve(text.size());
  std::copy_if(text.begin(), text.end(), std::back_inserter(result),
               [](char c) { return !IsWhiteSpace(c); });
  return result;
}

std::size_t CountPadding(std::string_view text) {
  std::size_t count = 0;
  while (count < 2 && count < text.size() && text[text.size() - 1 - count] == '=') {
    ++count;
  }
  return count;
}

// The bits behind the last byte must be zero (RFC 4648, section 3.5).
bool HasZeroTail(std::string_view symbols, std::size_t padding) {
  if (padding == 0) {
    return true;
  }
  const std::size_t value = kAlphabet.find(symbols.back());
  const std::size_t unusedBits = padding == 1 ? 0x3 : 0xF;
  return (value & unusedBits) == 0;
}

void CheckBase64(std::string_view text, std::size_t padding) {
  static const std::array<bool, 256> inAlphabet = MakeAlphabetTable();
  if (text.size() % 4 != 0) {
    throw Base64FormatException("The length of the Base64 text is not a multiple of four.");
  }
  const std::string_view symbols = text.substr(0, text.size() - padding);
  const bool isBase64 = std::all_of(symbols.begin(), symbols.end(), [](char c) {
    return inAlphabet[static_cast<unsigned char>(c)];
  });
  if (!isBase64) {
    throw Base64FormatException("The text holds a character that is not Base64.");
  }
  if (!HasZeroTail(symbols, padding)) {
    throw Base64FormatException("The Base64 text does not end on a byte boundary.");
  }
}

}  // namespace

std::string Base64Encode(const std::vector<unsigned char>& bytes) {
  std::string text(Base64_EncodedLength(bytes.data(), bytes.size()), '\0');
  std::size_t written = 0;
  Base64_Encode(bytes.data(), bytes.size(), text.data(), text.size(), &written);
  return text;
}

void Base64Decode(std::string_view text, std::vector<unsigned char>& bytes) {
  const std::string compact = WithoutWhiteSpace(text);
  const std::size_t padding = CountPadding(compact);
  CheckBase64(compact, padding);
  std::vector<unsigned char> result(compact.size() / 4 * 3);
  std::size_t written = 0;
  for (std::size_t from = 0; from < compact.size(); from += kDecodePiece) {
    const std::size_t count = std::min(kDecodePiece, compact.size() - from);
    const int decoded = EVP_DecodeBlock(result.data() + written, AsBytes(compact.data() + from),
                                        static_cast<int>(count));
    if (decoded < 0) {
      throw Base64FormatException("The text is not Base64.");
    }
    written += static_cast<std::size_t>(decoded);
  }
  result.resize(written - padding);
  bytes.swap(result);
}

std::string GenerateUuid() {
  return to_string(boost::uuids::random_generator()());
}

std::string ToLower(std::string_view text) {
  std::string result(text);
  for (char& c : result) {
    if (c >= 'A' && c <= 'Z') {
      c = static_cast<char>(c - 'A' + 'a');
    }
  }
  return result;
}

void Cleanse(std::string& text) noexcept {
  OPENSSL_cleanse(text.data(), text.capacity());
  text.clear();
}

}  // namespace Tarnik::StringUtil
