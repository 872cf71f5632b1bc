#ifndef TARNIK_XML_EXPAT_CALLS_H
#define TARNIK_XML_EXPAT_CALLS_H

#include <cstdint>
#include <cstring>

#include <expat.h>

/// Calls of Expat whose form depends on its version. Newer versions deprecate the older forms.
#define TARNIK_EXPAT_IS_AT_LEAST(minor) \
  (XML_MAJOR_VERSION > 2 || (XML_MAJOR_VERSION == 2 && XML_MINOR_VERSION >= (minor)))

namespace Tarnik::Xml {

/// Randomises the hash tables of a parser. Older versions use only the first bytes of the salt.
inline void SetHashSalt(XML_Parser parser, const std::uint8_t (&salt)[16]) noexcept {
#if TARNIK_EXPAT_IS_AT_LEAST(8)
  XML_SetHashSalt16Bytes(parser, salt);
#else
  unsigned long value = 0;
  std::memcpy(&value, salt, sizeof(value));
  XML_SetHashSalt(parser, value);
#endif
}

/// The offset of the current event in the document.
inline std::int64_t ByteIndex(XML_Parser parser) noexcept {
#if TARNIK_EXPAT_IS_AT_LEAST(9)
  return XML_GetCurrentByteIndex64(parser);
#else
  return XML_GetCurrentByteIndex(parser);
#endif
}

/// The part of the document that is in the parser's memory.
struct InputContext {
  const char* bytes = nullptr;  ///< may be null
  std::int64_t offset = 0;      ///< of the current event, in `bytes`
  std::uint64_t size = 0;
};

inline InputContext ContextOf(XML_Parser parser) noexcept {
  InputContext context;
#if TARNIK_EXPAT_IS_AT_LEAST(9)
  context.bytes = XML_GetInputContext64(parser, &context.offset, &context.size);
#else
  int offset = 0;
  int size = 0;
  context.bytes = XML_GetInputContext(parser, &offset, &size);
  context.offset = offset;
  context.size = static_cast<std::uint64_t>(size);
#endif
  return context;
}

}  // namespace Tarnik::Xml

#undef TARNIK_EXPAT_IS_AT_LEAST

#endif
