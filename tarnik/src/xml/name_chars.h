#ifndef TARNIK_XML_NAME_CHARS_H
#define TARNIK_XML_NAME_CHARS_H

// The characters of names without a colon, by XML 1.0, fourth edition, section 2.3 and appendix B.
// Expat reads names by the same table. The fifth edition allows more; documents with such names
// could be built and written, but not read.
namespace Tarnik::Xml {

/// True for a character that a name may begin with.
bool IsNameStart(char32_t character) noexcept;

/// True for a character that may follow.
bool IsNameCharacter(char32_t character) noexcept;

}  // namespace Tarnik::Xml

#endif
