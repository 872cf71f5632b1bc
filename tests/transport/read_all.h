#ifndef SSOCLIENT_TESTS_TRANSPORT_READ_ALL_H
#define SSOCLIENT_TESTS_TRANSPORT_READ_ALL_H

#include <cstddef>
#include <string>

#include <tarnik/core/reader.h>

namespace SsoClient::Testing {

inline std::string ReadAll(Tarnik::Reader& reader) {
  std::string text;
  char buffer[256];
  while (const std::size_t count = reader.Read(buffer, sizeof(buffer))) {
    text.append(buffer, count);
  }
  return text;
}

}  // namespace SsoClient::Testing

#endif
