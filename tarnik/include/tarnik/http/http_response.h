#ifndef TARNIK_HTTP_HTTP_RESPONSE_H
#define TARNIK_HTTP_HTTP_RESPONSE_H

#include <optional>
#include <string>

#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>

namespace Tarnik::Http {

struct StatusLine {
  int code;            ///< 100 to 999
  std::string reason;  ///< may be empty
};

/// A complete answer. Immutable except for its body, which is read once.
class TARNIK_EXPORT ClientResponse : public virtual Object {
 public:
  virtual const StatusLine& Status() const = 0;
  /// The first header of this name, without regard to case.
  virtual std::optional<std::string> Header(const std::string& name) const = 0;
  virtual Ref<Reader> Body() const = 0;
};

}  // namespace Tarnik::Http

#endif
