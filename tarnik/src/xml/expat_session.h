#ifndef TARNIK_XML_EXPAT_SESSION_H
#define TARNIK_XML_EXPAT_SESSION_H

#include <expat.h>

#include <cstddef>
#include <exception>
#include <limits>
#include <memory>
#include <string>
#include <type_traits>
#include <vector>

#include <tarnik/xml/xml_parser.h>

#include "xml/expat_memory.h"

namespace Tarnik::Xml {

/// Parses one document with Expat: passes its events to a handler and enforces the limits.
class ExpatSession {
 public:
  explicit ExpatSession(XMLHandler& handler);

  /// A buffer for the next `size` bytes of the document, valid until `ParseBuffer`.
  char* Buffer(std::size_t size);
  /// Parses the `size` bytes that were written to the buffer.
  void ParseBuffer(std::size_t size, bool last);

 private:
  static constexpr long kUnknown = -1;
  static constexpr long kNoLineFeed = std::numeric_limits<long>::max();

  struct Deleter {
    void operator()(XML_Parser parser) const noexcept { XML_ParserFree(parser); }
  };

  static void OnXmlDeclaration(void* session, const char* version, const char* encoding,
                               int standalone);
  static void OnDoctype(void* session, const char* name, const char* systemId, const char* publicId,
                        int hasInternalSubset);
  static void OnStartElement(void* session, const char* name, const char** attributes);
  static void OnEndElement(void* session, const char* name);
  static void OnCharacters(void* session, const char* text, int length);
  static void OnStartCDataSection(void* session);
  static void OnComment(void* session, const char* text);
  static void OnProcessingInstruction(void* session, const char* target, const char* text);

  // Runs `action` for an event. Exceptions are kept, since they must not pass through Expat.
  template <class Action>
  void Handle(Action action) noexcept;

  void CheckFirstBytes(const char* bytes, std::size_t size);
  /// The position of the current event.
  const Position& Locate();
  long FindLineFeed(long from, long current) const;
  void ThrowSyntaxError();

  static XML_Parser CreateParser(ExpatMemory& memory);

  XMLHandler& handler_;
  ExpatMemory memory_;
  std::unique_ptr<std::remove_pointer_t<XML_Parser>, Deleter> parser_;
  const char* buffer_ = nullptr;
  std::size_t totalBytes_ = 0;
  std::size_t depth_ = 0;
  std::vector<ParsedAttribute> attributes_;
  std::exception_ptr failure_;
  // Where the event before the current one begins.
  long locatedByte_ = 0;
  long lineStartByte_ = 0;
  // The next line feed of the chunk, cached to avoid a search for each event.
  long lineFeedByte_ = kUnknown;
  Position located_{1, 1};
};

}  // namespace Tarnik::Xml

#endif
