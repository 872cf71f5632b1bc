#ifndef TARNIK_HTTP_HTTP_REQUEST_H
#define TARNIK_HTTP_HTTP_REQUEST_H

#include <string>

#include <tarnik/core/ref.h>
#include <tarnik/core/writer.h>

namespace Tarnik::Http {

/// The methods that requests may have (RFC 9110, section 9.3).
enum class Method {
  GET,  ///< with a body only if one is written
  POST  ///< with a body, which may be empty
};

/// A request that is sent once. Used by one thread at a time until it is sent. Its body is cleansed
/// from memory when it is destroyed.
class TARNIK_EXPORT ClientRequest : public virtual Object {
 public:
  /// Sets a header; one of the same name (without regard to case) is replaced and keeps its
  /// position. Throws `InvalidArgumentException` when the name is not a token or the value contains
  /// control characters (RFC 9110, section 5), and for headers that the agent writes itself: Host,
  /// Content-Length, Transfer-Encoding, Connection, Cookie.
  virtual void SetHeader(const std::string& name, const std::string& value) = 0;
  /// The writer of the body.
  virtual Ref<Writer> BodyWriter() = 0;
};

/// Throws `InvalidArgumentException` when `target` is empty or contains blanks, control characters
/// or non-ASCII bytes.
TARNIK_EXPORT void CreateHttpRequest(Method method, const std::string& target,
                                     Ref<ClientRequest>& request);

}  // namespace Tarnik::Http

#endif
