#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <exception>
#include <limits>
#include <memory>
#include <new>
#include <string>
#include <string_view>
#include <type_traits>
#include <utility>
#include <vector>

#include <expat.h>
#include <sys/random.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/xml_parse_exception.h>
#include <tarnik/xml/xml_parser.h>

#include "xml/expat_calls.h"
#include "xml/expat_memory.h"

namespace Tarnik::Xml {

namespace {

static_assert(sizeof(XML_Char) == 1, "Expat must be built for UTF-8");

// Nearly all documents fit into the first piece. Expat scans every piece but the last once more,
// for a position that is not used here.
constexpr std::size_t kFirstPieceBytes = std::size_t{128} * 1024;
// The size of a usual security token.
constexpr std::size_t kUsualBytes = std::size_t{8} * 1024;

// A piece of a document, which is cleansed.
class Piece {
 public:
  Piece() : bytes_(new char[kUsualBytes]) {}
  // All of it, since a reader may have written something before it threw.
  ~Piece() { explicit_bzero(bytes_.get(), capacity_); }
  Piece(const Piece&) = delete;
  Piece& operator=(const Piece&) = delete;

  // Reads `size` bytes, or fewer when the reader ends.
  void Fill(Reader& reader, std::size_t size) {
    while (filled_ < size) {
      if (filled_ == capacity_) {
        Enlarge(std::min(2 * capacity_, size));
      }
      const std::size_t count = reader.Read(bytes_.get() + filled_, capacity_ - filled_);
      if (count == 0) {
        return;
      }
      filled_ += count;
    }
  }
  std::string_view Text() const noexcept { return {bytes_.get(), filled_}; }

 private:
  void Enlarge(std::size_t capacity) {
    std::unique_ptr<char[]> larger(new char[capacity]);
    std::memcpy(larger.get(), bytes_.get(), filled_);
    explicit_bzero(bytes_.get(), filled_);
    bytes_.swap(larger);
    capacity_ = capacity;
  }

  std::unique_ptr<char[]> bytes_;
  std::size_t capacity_ = kUsualBytes;
  std::size_t filled_ = 0;
};

struct Salt {
  std::uint8_t bytes[16];
  bool isRandom;
};

const Salt& SaltOfProcess() noexcept {
  static const Salt salt = [] {
    Salt made{};
    made.isRandom =
        getrandom(made.bytes, sizeof(made.bytes), 0) == static_cast<ssize_t>(sizeof(made.bytes));
    return made;
  }();
  return salt;
}

// At load, so that no thread can be inside the initialisation while another forks.
[[maybe_unused]] const bool kHasSaltAtLoad = (SaltOfProcess(), true);

// Without a salt, Expat would request one from the system for each parser.
void SetSaltOf(XML_Parser parser) noexcept {
  const Salt& salt = SaltOfProcess();
  if (salt.isRandom) {
    SetHashSalt(parser, salt.bytes);
  }
}

// Parses one document with Expat: passes its events to a handler and enforces the limits.
class ExpatSession {
 public:
  explicit ExpatSession(XMLHandler& handler);

  // A buffer for the next `size` bytes of the document, valid until `ParseBuffer`.
  char* Buffer(std::size_t size);
  // Parses the `size` bytes that were written to the buffer.
  void ParseBuffer(std::size_t size, bool last);

 private:
  static constexpr std::int64_t kUnknown = -1;
  static constexpr std::int64_t kNoLineFeed = std::numeric_limits<std::int64_t>::max();

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
  // The position of the current event.
  const Position& Locate();
  std::int64_t FindLineFeed(std::int64_t from, std::int64_t current) const;
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
  std::int64_t locatedByte_ = 0;
  std::int64_t lineStartByte_ = 0;
  // The next line feed of the piece, cached to avoid a search for each event.
  std::int64_t lineFeedByte_ = kUnknown;
  Position located_{1, 1};
};

ExpatSession::ExpatSession(XMLHandler& handler)
    : handler_(handler), parser_(CreateParser(memory_)) {
  XML_Parser parser = parser_.get();
  SetSaltOf(parser);
  XML_SetUserData(parser, this);
  XML_SetXmlDeclHandler(parser, OnXmlDeclaration);
  XML_SetStartDoctypeDeclHandler(parser, OnDoctype);
  XML_SetElementHandler(parser, OnStartElement, OnEndElement);
  XML_SetCharacterDataHandler(parser, OnCharacters);
  XML_SetStartCdataSectionHandler(parser, OnStartCDataSection);
  XML_SetCommentHandler(parser, OnComment);
  XML_SetProcessingInstructionHandler(parser, OnProcessingInstruction);
}

XML_Parser ExpatSession::CreateParser(ExpatMemory& memory) {
  const ExpatMemory::Scope scope(memory);
  XML_Parser parser = XML_ParserCreate_MM("UTF-8", &ExpatMemory::Suite(), nullptr);
  if (parser == nullptr) {
    throw std::bad_alloc();
  }
  return parser;
}

char* ExpatSession::Buffer(std::size_t size) {
  const ExpatMemory::Scope scope(memory_);
  auto* buffer = static_cast<char*>(XML_GetBuffer(parser_.get(), static_cast<int>(size)));
  if (buffer == nullptr) {
    throw std::bad_alloc();
  }
  buffer_ = buffer;
  return buffer;
}

void ExpatSession::ParseBuffer(std::size_t size, bool last) {
  if (totalBytes_ == 0) {
    CheckFirstBytes(buffer_, size);
  }
  totalBytes_ += size;
  if (totalBytes_ > kMaxDocumentBytes) {
    throw XMLParseException(
        "The document is longer than " + std::to_string(kMaxDocumentBytes) + " bytes", located_);
  }
  lineFeedByte_ = kUnknown;
  const ExpatMemory::Scope scope(memory_);
  const XML_Status status =
      XML_ParseBuffer(parser_.get(), static_cast<int>(size), last ? XML_TRUE : XML_FALSE);
  if (failure_ != nullptr) {
    std::rethrow_exception(failure_);
  }
  if (status != XML_STATUS_OK) {
    ThrowSyntaxError();
  }
  if (!last) {
    // The next piece removes everything before the incomplete token from the buffer.
    Locate();
  }
}

// Expat switches to UTF-16 at these bytes, whatever encoding it was given.
void ExpatSession::CheckFirstBytes(const char* bytes, std::size_t size) {
  if (size < 2) {
    return;
  }
  const std::string_view start(bytes, 2);
  if (start == "\xFE\xFF" || start == "\xFF\xFE" || start[0] == '\0' || start[1] == '\0') {
    throw XMLParseException("The document is in UTF-16 or UTF-32; only UTF-8 is accepted",
                            Position{1, 1});
  }
}

// Expat can compute the position itself, but scans each byte again for it.
const Position& ExpatSession::Locate() {
  const std::int64_t byte = ByteIndex(parser_.get());
  if (byte <= locatedByte_) {
    return located_;
  }
  if (lineFeedByte_ == kUnknown) {
    lineFeedByte_ = FindLineFeed(locatedByte_, byte);
  }
  while (lineFeedByte_ < byte) {
    ++located_.line;
    lineStartByte_ = lineFeedByte_ + 1;
    lineFeedByte_ = FindLineFeed(lineStartByte_, byte);
  }
  locatedByte_ = byte;
  located_.column = static_cast<unsigned long>(byte - lineStartByte_) + 1;
  return located_;
}

// The first line feed at or after `from` in Expat's buffer; `current` is the byte of the event.
std::int64_t ExpatSession::FindLineFeed(std::int64_t from, std::int64_t current) const {
  const InputContext context = ContextOf(parser_.get());
  if (context.bytes == nullptr || current - from > context.offset) {
    return kNoLineFeed;
  }
  const std::int64_t offset = context.offset - (current - from);
  const char* start = context.bytes + offset;
  const void* found = std::memchr(start, '\n', context.size - static_cast<std::uint64_t>(offset));
  return found == nullptr ? kNoLineFeed : from + (static_cast<const char*>(found) - start);
}

void ExpatSession::ThrowSyntaxError() {
  const XML_Error error = XML_GetErrorCode(parser_.get());
  if (error == XML_ERROR_NO_MEMORY) {
    throw std::bad_alloc();
  }
  throw XMLParseException(XML_ErrorString(error), Locate());
}

template <class Action>
void ExpatSession::Handle(Action action) noexcept {
  // Expat may report a few more events after XML_StopParser.
  if (failure_ != nullptr) {
    return;
  }
  try {
    action(Locate());
  } catch (...) {
    failure_ = std::current_exception();
    XML_StopParser(parser_.get(), XML_FALSE);
  }
}

void ExpatSession::OnXmlDeclaration(void* session, const char* version, const char* encoding, int) {
  static_cast<ExpatSession*>(session)->Handle([=](const Position& position) {
    if (version != nullptr && std::string_view(version) != "1.0") {
      throw XMLParseException("The document is not XML 1.0", position);
    }
    if (encoding != nullptr && StringUtil::ToLower(encoding) != "utf-8") {
      throw XMLParseException("The document declares an encoding other than UTF-8", position);
    }
  });
}

void ExpatSession::OnDoctype(void* session, const char*, const char*, const char*, int) {
  static_cast<ExpatSession*>(session)->Handle([](const Position& position) {
    throw XMLParseException("The document holds a DOCTYPE, which is not accepted", position);
  });
}

void ExpatSession::OnStartElement(void* session, const char* name, const char** attributes) {
  auto* self = static_cast<ExpatSession*>(session);
  self->Handle([=](const Position& position) {
    if (++self->depth_ > kMaxElementDepth) {
      throw XMLParseException("Elements nest deeper than " + std::to_string(kMaxElementDepth),
                              position);
    }
    self->attributes_.clear();
    for (const char** next = attributes; next[0] != nullptr; next += 2) {
      self->attributes_.push_back({next[0], next[1]});
    }
    self->handler_.StartElement(position, name, self->attributes_.data(), self->attributes_.size());
  });
}

void ExpatSession::OnEndElement(void* session, const char*) {
  auto* self = static_cast<ExpatSession*>(session);
  self->Handle([=](const Position& position) {
    --self->depth_;
    self->handler_.EndElement(position);
  });
}

void ExpatSession::OnCharacters(void* session, const char* text, int length) {
  auto* self = static_cast<ExpatSession*>(session);
  self->Handle([=](const Position& position) {
    self->handler_.Characters(position, {text, static_cast<std::size_t>(length)});
  });
}

void ExpatSession::OnStartCDataSection(void* session) {
  auto* self = static_cast<ExpatSession*>(session);
  self->Handle([=](const Position& position) { self->handler_.StartCDataSection(position); });
}

void ExpatSession::OnComment(void* session, const char* text) {
  auto* self = static_cast<ExpatSession*>(session);
  self->Handle([=](const Position& position) { self->handler_.Comment(position, text); });
}

void ExpatSession::OnProcessingInstruction(void* session, const char* target, const char* text) {
  auto* self = static_cast<ExpatSession*>(session);
  self->Handle([=](const Position& position) {
    self->handler_.ProcessingInstruction(position, target, text);
  });
}

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
    // Each piece is as long as all previous ones together. Expat scans an incomplete token again
    // with the next piece, so pieces of equal length would make long tokens take quadratic time.
    std::size_t pieceBytes = kFirstPieceBytes;
    std::size_t total = 0;
    for (bool last = false; !last; pieceBytes = std::max(pieceBytes, total)) {
      const std::size_t filled = Feed(session, pieceBytes, *reader);
      total += filled;
      last = filled < pieceBytes;
      session.ParseBuffer(filled, last);
    }
    return handler->EndDocument();
  }

 private:
  // Reads up to `size` bytes into the session. Their first copy is freed before the tree is built,
  // which can then use its memory.
  static std::size_t Feed(ExpatSession& session, std::size_t size, Reader& reader) {
    Piece piece;
    piece.Fill(reader, size);
    const std::string_view text = piece.Text();
    char* buffer = session.Buffer(std::max(text.size(), std::size_t{1}));
    text.copy(buffer, text.size());
    return text.size();
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
