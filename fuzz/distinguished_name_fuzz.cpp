// No text makes the reader throw. A name that it reads is the name that it reads again from what
// OpenSSL prints of it. A name that OpenSSL makes from the input equals its text, in whatever of
// the described forms that is written, and another name does not.
#include <string>
#include <vector>

#include <fuzzer/FuzzedDataProvider.h>
#include <openssl/bio.h>
#include <openssl/x509.h>

#include "crypto/distinguished_name.h"
#include "crypto/distinguished_name_reader.h"
#include "input.h"
#include "support/openssl.h"

namespace {

using Tarnik::Crypto::DistinguishedName;
using OwnedName = Tarnik::OpenSsl::Owned<X509_NAME, X509_NAME_free>;

// OpenSSL cuts object identifiers that are longer.
constexpr int kMaxType = 79;

// What the text names, or null.
OwnedName NameIn(const std::string& text) {
  const std::string der = Tarnik::Crypto::DerOfNameText(text);
  const auto* position = reinterpret_cast<const unsigned char*>(der.data());
  return OwnedName(d2i_X509_NAME(nullptr, &position, static_cast<long>(der.size())));
}

// Whether the text that OpenSSL prints represents each value: of other types of strings it prints
// the characters without the type.
bool IsPrintable(const X509_NAME* name) {
  for (int i = 0; i < X509_NAME_entry_count(name); ++i) {
    const X509_NAME_ENTRY* const entry = X509_NAME_get_entry(name, i);
    if (ASN1_STRING_type(X509_NAME_ENTRY_get_data(entry)) != V_ASN1_UTF8STRING ||
        OBJ_obj2txt(nullptr, 0, X509_NAME_ENTRY_get_object(entry), 1) > kMaxType) {
      return false;
    }
  }
  return true;
}

std::string Printed(const X509_NAME* name) {
  const Tarnik::OpenSsl::OwnedBio text(BIO_new(BIO_s_mem()));
  Fuzz::Require(X509_NAME_print_ex(text.get(), name, 0, XN_FLAG_RFC2253) >= 0);
  char* characters = nullptr;
  const long size = BIO_get_mem_data(text.get(), &characters);
  return {characters, static_cast<std::size_t>(size)};
}

void CheckText(const std::string& text) {
  const DistinguishedName read = DistinguishedName::FromText(text);
  const OwnedName name = NameIn(text);
  if (text.size() > DistinguishedName::kMaxText || name == nullptr) {
    Fuzz::Require(!read.Equals(read));
    return;
  }
  Fuzz::Require(read.Equals(DistinguishedName(name.get())));
  const std::string printed = Printed(name.get());
  if (IsPrintable(name.get()) && printed.size() <= DistinguishedName::kMaxText) {
    Fuzz::Require(DistinguishedName::FromText(printed).Equals(read));
  }
}

struct Attribute {
  std::vector<std::string> types;  // its spellings; OpenSSL knows the first one
  std::vector<std::string> characters;
  bool isInPartBefore;
};

Attribute MakeAttribute(FuzzedDataProvider& input) {
  static const std::vector<std::string> kTypes[] = {
      {"CN", "cn", "commonName", "2.5.4.3", "OID.2.5.4.3"},
      {"O", "organizationName", "oid.2.5.4.10"},
      {"ST", "S", "stateOrProvinceName"},
      {"emailAddress", "E", "EMAILADDRESS", "1.2.840.113549.1.9.1"},
      {"DC", "domainComponent"},
      {"SN", "SURNAME"},
      {"serialNumber", "SERIALNUMBER", "2.5.4.5"},
      {"1.3.6.1.4.1.99999.1", "OID.1.3.6.1.4.1.99999.1"}};
  static const char* const kCharacters[] = {"a", "B", "0", "f",  "#",  " ", ",", ";",  "+",
                                            "=", "<", ">", "\"", "\\", "-", "é", "例", "𝒮"};
  Attribute attribute{kTypes[input.ConsumeIntegralInRange<std::size_t>(0, std::size(kTypes) - 1)],
                      {},
                      input.ConsumeIntegralInRange(0, 3) == 3};
  for (int left = input.ConsumeIntegralInRange(1, 6); left > 0; --left) {
    attribute.characters.emplace_back(
        kCharacters[input.ConsumeIntegralInRange<std::size_t>(0, std::size(kCharacters) - 1)]);
  }
  return attribute;
}

std::string ValueOf(const Attribute& attribute) {
  std::string value;
  for (const std::string& character : attribute.characters) {
    value += character;
  }
  return value;
}

std::string Hexadecimal(const std::string& bytes, const char* before, bool isUpper) {
  const char* const digits = isUpper ? "0123456789ABCDEF" : "0123456789abcdef";
  std::string text;
  for (const char c : bytes) {
    const auto byte = static_cast<unsigned char>(c);
    text += before;
    text += {digits[byte >> 4], digits[byte & 0xF]};
  }
  return text;
}

// RFC 4514, section 2.4.
std::string EscapedValue(const Attribute& attribute, FuzzedDataProvider& input) {
  std::string text;
  for (const std::string& character : attribute.characters) {
    const int form = input.ConsumeIntegralInRange(0, 3);
    if (form >= 2) {
      text += Hexadecimal(character, "\\", form == 3);
    } else if (std::string(" \"#+,;<>\\").find(character) != std::string::npos ||
               (character == "=" && form == 1)) {
      text += "\\" + character;
    } else {
      text += character;
    }
  }
  return text;
}

// RFC 1779, section 2.3; .NET doubles quotation marks.
std::string QuotedValue(const Attribute& attribute, FuzzedDataProvider& input) {
  std::string text = "\"";
  for (const std::string& character : attribute.characters) {
    const bool isMark = character == "\"";
    text += isMark && input.ConsumeBool() ? "\"" : isMark || character == "\\" ? "\\" : "";
    text += character;
  }
  return text + "\"";
}

std::string TextOf(const Attribute& attribute, FuzzedDataProvider& input) {
  const auto type = input.ConsumeIntegralInRange<std::size_t>(0, attribute.types.size() - 1);
  const std::string blank = input.ConsumeBool() ? " " : "";
  std::string text = attribute.types[type] + blank + "=" + blank;
  switch (input.ConsumeIntegralInRange(0, 3)) {
    case 0: {
      const std::string value = ValueOf(attribute);
      return text + "#0c" +
             Hexadecimal(std::string(1, static_cast<char>(value.size())) + value, "", true);
    }
    case 1:
      return text + QuotedValue(attribute, input) + blank;
    default:
      return text + EscapedValue(attribute, input) + blank;
  }
}

DistinguishedName NameOf(const std::vector<Attribute>& attributes) {
  const OwnedName name(X509_NAME_new());
  for (const Attribute& attribute : attributes) {
    const std::string value = ValueOf(attribute);
    const bool isFirst = &attribute == &attributes.front();
    Fuzz::Require(X509_NAME_add_entry_by_txt(name.get(), attribute.types.front().c_str(),
                                             V_ASN1_UTF8STRING,
                                             reinterpret_cast<const unsigned char*>(value.data()),
                                             static_cast<int>(value.size()), -1,
                                             attribute.isInPartBefore && !isFirst ? -1 : 0) == 1);
  }
  return DistinguishedName(name.get());
}

// The most specific part comes first.
std::string TextOf(const std::vector<Attribute>& attributes, FuzzedDataProvider& input) {
  std::string text;
  std::string part;
  for (const Attribute& attribute : attributes) {
    const bool isFirst = &attribute == &attributes.front();
    if (attribute.isInPartBefore && !isFirst) {
      part += "+" + TextOf(attribute, input);
      continue;
    }
    const char* const separators[] = {",", ";", ", ", " ; "};
    text = part.empty()
               ? text
               : part + (text.empty() ? "" : separators[input.ConsumeIntegralInRange(0, 3)]) + text;
    part = TextOf(attribute, input);
  }
  return text.empty() ? part : part + "," + text;
}

void CheckName(FuzzedDataProvider& input) {
  std::vector<Attribute> attributes;
  for (int left = input.ConsumeIntegralInRange(1, 5); left > 0; --left) {
    attributes.push_back(MakeAttribute(input));
  }
  const DistinguishedName name = NameOf(attributes);
  Fuzz::Require(DistinguishedName::FromText(TextOf(attributes, input)).Equals(name));
  const auto changed = input.ConsumeIntegralInRange<std::size_t>(0, attributes.size() - 1);
  attributes[changed].characters.emplace_back("x");
  Fuzz::Require(!DistinguishedName::FromText(TextOf(attributes, input)).Equals(name));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  CheckText(Fuzz::TextOf(data, size));
  FuzzedDataProvider input(data, size);
  CheckName(input);
  return 0;
}
