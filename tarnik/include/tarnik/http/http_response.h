#ifndef TARNIK_HTTP_HTTP_RESPONSE_H
#define TARNIK_HTTP_HTTP_RESPONSE_H

#include <optional>
#include <string>

#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>

namespace Tarnik::Http {

/// The first line of an answer (RFC 9112, section 4).
struct StatusLine {
  int code;            ///< 100 to 999
  std::string reason;  ///< may be empty
};

/// A complete answer. Immutable except for its body, which is read once.
class TARNIK_EXPORT ClientResponse : public virtual Object {
 public:
  /// The status; valid as long as the answer.
  virtual const StatusLine& Status() const = 0;
  /// The first header of this name, without regard to case.
  virtual std::optional<std::string> Header(const std::string& name) const = 0;
  /// The whole body. Each call returns the same reader.
  virtual Ref<Reader> Body() const = 0;
};

}  // namespace Tarnik::Http

#endif
