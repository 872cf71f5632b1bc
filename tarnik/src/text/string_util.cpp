#include <algorithm>
#include <array>
#include <cstddef>

#include <boost/uuid/random_generator.hpp>
#include <boost/uuid/uuid_io.hpp>
#include <openssl/evp.h>

#include <tarnik/core/exception.h>
#include <tarnik/text/base64.h>
#include <tarnik/text/string_util.h>

#include "support/ascii.h"
#include "support/cleanse.h"

namespace Tarnik::StringUtil {
namespace {

// OpenSSL takes lengths as int, so long inputs are decoded in pieces of whole groups.
constexpr std::size_t kDecodePiece = std::size_t{4} << 20;
constexpr std::string_view kAlphabet =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

const unsigned char* AsBytes(const char* text) {
  return reinterpret_cast<const unsigned char*>(text);
}

enum CharacterClass : unsigned char { kOther, kSymbol, kPadding, kWhiteSpace };

constexpr std::array<CharacterClass, 256> Classify() {
  std::array<CharacterClass, 256> classes{};
  for (const char symbol : kAlphabet) {
    classes[static_cast<unsigned char>(symbol)] = kSymbol;
  }
  for (const char space : std::string_view("\t\n\r ")) {
    classes[static_cast<unsigned char>(space)] = kWhiteSpace;
  }
  classes['='] = kPadding;
  return classes;
}

constexpr std::array<CharacterClass, 256> kClasses = Classify();

struct CompactText {
  std::string text;  // without white space
  std::size_t symbols = 0;
};

CompactText Compact(std::string_view text) {
  CompactText result;
  result.text.resize(text.size());
  // Locals, since the compiler must assume that a written character changes the members.
  char* const start = result.text.data();
  char* end = start;
  std::size_t symbols = 0;
  // Each character is written, and white space is overwritten by the next one, which needs no
  // branch.
  for (const char character : text) {
    const CharacterClass kind = kClasses[static_cast<unsigned char>(character)];
    *end = character;
    end += kind == kWhiteSpace ? 0 : 1;
    symbols += kind == kSymbol ? 1 : 0;
  }
  result.text.resize(static_cast<std::size_t>(end - start));
  result.symbols = symbols;
  return result;
}

std::size_t CountPadding(std::string_view text) {
  std::size_t count = 0;
  while (count < 2 && count < text.size() && text[text.size() - 1 - count] == '=') {
    ++count;
  }
  return count;
}

// The bits after the last byte must be zero (RFC 4648, section 3.5).
bool HasZeroTail(std::string_view symbols, std::size_t padding) {
  if (padding == 0) {
    return true;
  }
  const std::size_t value = kAlphabet.find(symbols.back());
  const std::size_t unusedBits = padding == 1 ? 0x3 : 0xF;
  return (value & unusedBits) == 0;
}

void CheckBase64(const CompactText& compact, std::size_t padding) {
  if (compact.text.size() % 4 != 0) {
    throw Base64FormatException("The length of the Base64 text is not a multiple of four.");
  }
  if (compact.symbols + padding != compact.text.size()) {
    throw Base64FormatException("The text holds a character that is not Base64.");
  }
  const std::string_view symbols(compact.text.data(), compact.symbols);
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
  const CompactText checked = Compact(text);
  const std::string& compact = checked.text;
  const std::size_t padding = CountPadding(compact);
  CheckBase64(checked, padding);
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
  std::transform(result.begin(), result.end(), result.begin(), ToLowerAscii);
  return result;
}

void Cleanse(std::string& text) noexcept {
  CleanseBuffer(text);
}

void Cleanse(std::vector<unsigned char>& bytes) noexcept {
  CleanseBuffer(bytes);
}

}  // namespace Tarnik::StringUtil
