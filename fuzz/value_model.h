#ifndef FUZZ_VALUE_MODEL_H
#define FUZZ_VALUE_MODEL_H

#include <cstddef>
#include <optional>
#include <string>
#include <vector>

namespace Fuzz {

/// Values of texts, read apart from the libraries; none for a text that is not of the form.

/// Microseconds since 1970 of an xs:dateTime (XML Schema Part 2, section 3.2.7) in the years 0001
/// to 9999, in UTC unless the text has a zone. Digits after the sixth of a fraction are dropped.
std::optional<long> DateOf(const std::string& text);
/// The bytes of a Base64 text in its only spelling (RFC 4648, section 4), apart from white space.
std::optional<std::vector<unsigned char>> BytesOf(const std::string& text);
/// The Base64 text of bytes, as OpenSSL writes it.
std::string Base64Of(const unsigned char* bytes, std::size_t size);
std::string Base64Of(const std::string& bytes);
/// A number from 0 to 4,294,967,295 of digits, possibly with a sign.
std::optional<unsigned long> CountOf(const std::string& text);
/// "true", "false", "1" or "0", in any letter case.
std::optional<bool> BooleanOf(const std::string& text);

/// `text` with each ASCII letter in lower case.
std::string LowerCaseOf(std::string text);

/// `text` without the white space of XML at both ends, where the name in a QName begins and ends.
std::string Trimmed(const std::string& text);

}  // namespace Fuzz

#endif
