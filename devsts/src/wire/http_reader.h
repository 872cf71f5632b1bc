#ifndef DEVSTS_WIRE_HTTP_READER_H
#define DEVSTS_WIRE_HTTP_READER_H

#include <string>

#include "devsts/server.h"
#include "wire/connection.h"

namespace DevSts {

// Reads HTTP/1.1 requests from a connection, one after another.
class HttpReader {
 public:
  enum class Outcome {
    Request,
    End,        // the peer closed the connection between requests
    Malformed,  // not HTTP, too large, or incomplete
  };

  explicit HttpReader(Connection& connection) : connection_(connection) {}

  // Fills in head, method, target, headers and body. `keepAlive` is set to what the request asks
  // for.
  Outcome Next(ReceivedRequest& request, bool& keepAlive);

 private:
  bool ReadMore();

  Connection& connection_;
  std::string buffer_;
};

}  // namespace DevSts

#endif
