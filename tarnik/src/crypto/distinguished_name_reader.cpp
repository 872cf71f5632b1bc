#include "crypto/distinguished_name_reader.h"

#include <cstddef>
#include <optional>
#include <vector>

#include "crypto/attribute_types.h"
#include "crypto/der_writer.h"
#include "support/ascii.h"

namespace Tarnik::Crypto {
namespace {

constexpr bool IsBlank(char c) noexcept {
  return c == ' ' || c == '\t' || c == '\r' || c == '\n';
}

constexpr bool IsTypeCharacter(char c) noexcept {
  return IsLetter(c) || IsDigit(c) || c == '-' || c == '.';
}

// Characters that only an escape or quotes may contain (RFC 4514, section 3), besides the
// separators.
constexpr bool MustBeEscaped(char c) noexcept {
  return c == '"' || c == '<' || c == '>' || c == '\0';
}

constexpr bool IsSeparator(char c) noexcept {
  return c == ',' || c == ';' || c == '+';
}

// What may follow a reverse solidus, besides two hexadecimal digits (RFC 4514, section 3).
constexpr bool MayBeEscaped(char c) noexcept {
  constexpr std::string_view kCharacters = " \"#+,;<=>\\";
  return kCharacters.find(c) != std::string_view::npos;
}

constexpr int ValueOfDigit(char c) noexcept {
  return IsDigit(c) ? c - '0' : ToLowerAscii(c) - 'a' + 10;
}

/// The parts of a name in the order of the text. Functions return false, or nothing, at a syntax
/// error.
class NameTextReader {
 public:
  explicit NameTextReader(std::string_view text) : rest_(text) {}

  /// Each part is the encoded attributes of one RelativeDistinguishedName.
  bool Read(std::vector<std::string>& parts);

 private:
  bool ReadAttribute(std::string& part);
  std::optional<std::string> ReadType();
  /// The encoded value.
  std::optional<std::string> ReadValue();
  std::optional<std::string> ReadHexadecimal();
  std::optional<std::string> ReadQuoted();
  std::optional<std::string> ReadPlain();
  /// Reads what follows a reverse solidus.
  bool ReadEscaped(std::string& value);
  /// Reads two hexadecimal digits, if they are next.
  bool ReadByte(std::string& bytes);

  bool IsAtEnd() const noexcept { return rest_.empty(); }
  bool IsAt(char c) const noexcept { return !rest_.empty() && rest_.front() == c; }
  char Take() noexcept;
  bool TakeIf(char c) noexcept;
  void SkipBlanks() noexcept;

  std::string_view rest_;
};

bool NameTextReader::Read(std::vector<std::string>& parts) {
  int attributes = 0;
  for (;;) {
    std::string& part = parts.emplace_back();
    do {
      if (++attributes > kMaxNameAttributes || !ReadAttribute(part)) {
        return false;
      }
    } while (TakeIf('+'));
    if (IsAtEnd()) {
      return true;
    }
    Take();  // a comma or a semicolon
  }
}

// Ends at a separator or at the end of the text.
bool NameTextReader::ReadAttribute(std::string& part) {
  SkipBlanks();
  const auto type = ReadType();
  SkipBlanks();
  if (!type || !TakeIf('=')) {
    return false;
  }
  SkipBlanks();
  const auto value = ReadValue();
  SkipBlanks();
  if (!value || (!IsAtEnd() && !IsSeparator(rest_.front()))) {
    return false;
  }
  part += DerOf(DerTag::kSequence, DerOf(DerTag::kObjectIdentifier, *type) + *value);
  return true;
}

std::optional<std::string> NameTextReader::ReadType() {
  std::size_t length = 0;
  while (length < rest_.size() && IsTypeCharacter(rest_[length])) {
    ++length;
  }
  std::string type = AttributeTypeOf(rest_.substr(0, length));
  rest_.remove_prefix(length);
  if (type.empty()) {
    return std::nullopt;
  }
  return type;
}

std::optional<std::string> NameTextReader::ReadValue() {
  if (TakeIf('#')) {
    return ReadHexadecimal();
  }
  const auto value = TakeIf('"') ? ReadQuoted() : ReadPlain();
  if (!value) {
    return std::nullopt;
  }
  return DerOf(DerTag::kUtf8String, *value);
}

// RFC 4514, section 2.4: the encoded value itself.
std::optional<std::string> NameTextReader::ReadHexadecimal() {
  std::string bytes;
  while (ReadByte(bytes)) {
  }
  if (bytes.empty()) {
    return std::nullopt;
  }
  return bytes;
}

// RFC 1779, section 2.3. In .NET a quotation mark within is doubled.
std::optional<std::string> NameTextReader::ReadQuoted() {
  std::string value;
  while (!IsAtEnd()) {
    const char c = Take();
    if (c == '\0') {
      return std::nullopt;
    }
    if (c == '\\') {
      if (!ReadEscaped(value)) {
        return std::nullopt;
      }
    } else if (c == '"' && !TakeIf('"')) {
      return value;
    } else {
      value.push_back(c);
    }
  }
  return std::nullopt;
}

// Blanks at the end belong to the value only if the last one is escaped.
std::optional<std::string> NameTextReader::ReadPlain() {
  std::string value;
  std::size_t length = 0;
  while (!IsAtEnd() && !IsSeparator(rest_.front())) {
    const char c = Take();
    if (MustBeEscaped(c)) {
      return std::nullopt;
    }
    if (c != '\\') {
      value.push_back(c);
    } else if (!ReadEscaped(value)) {
      return std::nullopt;
    }
    length = c == '\\' || !IsBlank(c) ? value.size() : length;
  }
  value.resize(length);
  return value;
}

// .NET writes a reverse solidus of the value unchanged. It is one that begins no escape.
bool NameTextReader::ReadEscaped(std::string& value) {
  if (IsAtEnd()) {
    return false;
  }
  if (MayBeEscaped(rest_.front())) {
    value.push_back(Take());
  } else if (!ReadByte(value)) {
    value.push_back('\\');
  }
  return true;
}

bool NameTextReader::ReadByte(std::string& bytes) {
  if (rest_.size() < 2 || !IsHexDigit(rest_[0]) || !IsHexDigit(rest_[1])) {
    return false;
  }
  bytes.push_back(static_cast<char>(ValueOfDigit(rest_[0]) * 16 + ValueOfDigit(rest_[1])));
  rest_.remove_prefix(2);
  return true;
}

char NameTextReader::Take() noexcept {
  const char c = rest_.front();
  rest_.remove_prefix(1);
  return c;
}

bool NameTextReader::TakeIf(char c) noexcept {
  if (!IsAt(c)) {
    return false;
  }
  rest_.remove_prefix(1);
  return true;
}

void NameTextReader::SkipBlanks() noexcept {
  while (!IsAtEnd() && IsBlank(rest_.front())) {
    rest_.remove_prefix(1);
  }
}

}  // namespace

// The encoding begins with the least specific part (RFC 4514, section 2.1).
std::string DerOfNameText(std::string_view text) {
  std::vector<std::string> parts;
  if (!NameTextReader(text).Read(parts)) {
    return {};
  }
  std::string name;
  for (auto part = parts.rbegin(); part != parts.rend(); ++part) {
    name += DerOf(DerTag::kSet, *part);
  }
  return DerOf(DerTag::kSequence, name);
}

}  // namespace Tarnik::Crypto
