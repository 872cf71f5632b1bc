#ifndef TARNIK_TESTS_HTTP_RESPONSE_BODY_H
#define TARNIK_TESTS_HTTP_RESPONSE_BODY_H

#include <cstddef>
#include <string>

#include <tarnik/http/http_response.h>

namespace Tarnik::Testing {

inline std::string BodyOf(const Http::ClientResponse& response) {
  std::string body;
  char buffer[1000];
  while (const std::size_t count = response.Body()->Read(buffer, sizeof(buffer))) {
    body.append(buffer, count);
  }
  return body;
}

}  // namespace Tarnik::Testing

#endif
