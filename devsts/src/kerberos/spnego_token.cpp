#include "kerberos/spnego_token.h"

#include <cstddef>
#include <iterator>
#include <optional>
#include <span>

namespace DevSts {
namespace {

using View = std::span<const unsigned char>;

constexpr unsigned char kOctetString = 0x04;
constexpr unsigned char kObjectIdentifier = 0x06;
constexpr unsigned char kEnumerated = 0x0a;
constexpr unsigned char kSequence = 0x30;
constexpr unsigned char kInitialToken = 0x60;  // RFC 2743, section 3.1

constexpr unsigned char Field(unsigned number) {
  return static_cast<unsigned char>(0xa0 + number);
}

// One element of DER (X.690).
struct Element {
  unsigned char tag = 0;
  View whole;
  View content;
};

// Removes the first element from the octets and returns it.
Element Take(View& octets) {
  if (octets.size() < 2) {
    throw SpnegoError("the message ends early");
  }
  std::size_t head = 2;
  std::size_t size = octets[1];
  if (size >= 0x80) {
    const std::size_t count = size - 0x80;
    if (count == 0 || count > 4 || octets.size() < head + count) {
      throw SpnegoError("a length is not readable");
    }
    size = 0;
    for (std::size_t i = 0; i < count; ++i) {
      size = size << 8U | octets[head++];
    }
  }
  if (size > octets.size() - head) {
    throw SpnegoError("the message ends early");
  }
  const Element element{octets[0], octets.first(head + size), octets.subspan(head, size)};
  octets = octets.subspan(head + size);
  return element;
}

Element Expect(View& octets, unsigned char tag) {
  const Element element = Take(octets);
  if (element.tag != tag) {
    throw SpnegoError("another element was expected");
  }
  return element;
}

View ContentOf(View octets, unsigned char tag) {
  return Expect(octets, tag).content;
}

std::optional<View> FieldOf(View sequence, unsigned number) {
  while (!sequence.empty()) {
    const Element element = Take(sequence);
    if (element.tag == Field(number)) {
      return element.content;
    }
  }
  return std::nullopt;
}

View ResponseFields(const Octets& response) {
  return ContentOf(ContentOf(response, Field(1)), kSequence);
}

// X.690, section 8.1.3.
Octets WrittenLength(std::size_t size) {
  const auto low = static_cast<unsigned char>(size);
  if (size < 0x80) {
    return {low};
  }
  if (size < 0x100) {
    return {0x81, low};
  }
  return {0x82, static_cast<unsigned char>(size >> 8U), low};
}

Octets Wrapped(unsigned char tag, View content) {
  const Octets length = WrittenLength(content.size());
  Octets octets{tag};
  octets.reserve(1 + length.size() + content.size());
  octets.insert(octets.end(), length.begin(), length.end());
  octets.insert(octets.end(), content.begin(), content.end());
  return octets;
}

Octets StateField(NegState state) {
  const auto value = static_cast<unsigned char>(state);
  return Wrapped(Field(0), Wrapped(kEnumerated, View(&value, 1)));
}

Octets Response(const Octets& fields) {
  return Wrapped(Field(1), Wrapped(kSequence, fields));
}

}  // namespace

Octets MechTypesIn(const Octets& firstLeg) {
  View token = ContentOf(firstLeg, kInitialToken);
  Expect(token, kObjectIdentifier);
  const View fields = ContentOf(ContentOf(token, Field(0)), kSequence);
  std::optional<View> list = FieldOf(fields, 0);
  if (!list) {
    throw SpnegoError("the list of mechanisms is missing");
  }
  const View whole = Expect(*list, kSequence).whole;
  return {whole.begin(), whole.end()};
}

Octets WithMic(const Octets& response, NegState state, const Octets& mic) {
  View rest = ResponseFields(response);
  ContentOf(Expect(rest, Field(0)).content, kEnumerated);
  Octets fields = StateField(state);
  fields.insert(fields.end(), rest.begin(), rest.end());
  const Octets signature = Wrapped(Field(3), Wrapped(kOctetString, mic));
  fields.insert(fields.end(), signature.begin(), signature.end());
  return Response(fields);
}

Octets MicIn(const Octets& response) {
  const std::optional<View> field = FieldOf(ResponseFields(response), 3);
  const View mic = field ? ContentOf(*field, kOctetString) : View();
  return {mic.begin(), mic.end()};
}

Octets WriteResponse(NegState state) {
  return Response(StateField(state));
}

}  // namespace DevSts
