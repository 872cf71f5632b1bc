#include <tarnik/xml/xml_parser.h>

#include <algorithm>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>

#include "xml/expat_session.h"

namespace Tarnik::Xml {

namespace {

// The size of a usual security token. Expat adds 1 KiB and rounds up to a power of two.
constexpr std::size_t kFirstChunkBytes = std::size_t{7} * 1024;

class XMLParserImpl final : public XMLParser, public ObjectImpl {
 public:
  XMLParserImpl(Reader* reader, XMLHandler* handler) : reader_(reader), handler_(handler) {}

  Ref<Object> Parse() override {
    if (handler_ == nullptr) {
      throw InvalidStateException("The parser has been used.");
    }
    const Ref<XMLHandler> handler = std::move(handler_);
    const Ref<Reader> reader = std::move(reader_);
    ExpatSession session(*handler);
    // Each chunk is as long as all previous ones together. Expat scans an incomplete token again
    // with the next chunk, so chunks of equal length would make long tokens take quadratic time.
    std::size_t chunkBytes = kFirstChunkBytes;
    std::size_t total = 0;
    for (bool last = false; !last; chunkBytes = std::max(chunkBytes, total)) {
      char* chunk = session.Buffer(chunkBytes);
      const std::size_t filled = Fill(*reader, chunk, chunkBytes);
      total += filled;
      last = filled < chunkBytes;
      session.ParseBuffer(filled, last);
    }
    return handler->EndDocument();
  }

 private:
  static std::size_t Fill(Reader& reader, char* buffer, std::size_t size) {
    std::size_t filled = 0;
    while (filled < size) {
      const std::size_t count = reader.Read(buffer + filled, size - filled);
      if (count == 0) {
        break;
      }
      filled += count;
    }
    return filled;
  }

  Ref<Reader> reader_;
  Ref<XMLHandler> handler_;
};

}  // namespace

Ref<XMLParser> CreateXMLParser(Reader* reader, XMLHandler* handler) {
  if (reader == nullptr || handler == nullptr) {
    throw InvalidArgumentException("A parser needs a reader and a handler.");
  }
  return MakeRef<XMLParserImpl>(reader, handler);
}

}  // namespace Tarnik::Xml
