#include "written_request.h"

#include <algorithm>
#include <cstddef>

#include "input.h"

namespace Fuzz {

std::string LowerCase(std::string text) {
  std::transform(text.begin(), text.end(), text.begin(),
                 [](char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c + 32) : c; });
  return text;
}

WrittenRequest TakeRequest(std::string& wire) {
  const auto line = [&wire] {
    const std::size_t end = wire.find("\r\n");
    Require(end != std::string::npos);
    const std::string text = wire.substr(0, end);
    wire.erase(0, end + 2);
    Require(text.find_first_of(std::string("\r\n\0", 3)) == std::string::npos);
    return text;
  };
  WrittenRequest request;
  const std::string start = line();
  const std::size_t first = start.find(' ');
  const std::size_t second = start.find(' ', first + 1);
  Require(second != std::string::npos && start.substr(second) == " HTTP/1.1");
  request.method = start.substr(0, first);
  request.target = start.substr(first + 1, second - first - 1);
  std::size_t length = 0;
  for (std::string field = line(); !field.empty(); field = line()) {
    const std::size_t colon = field.find(": ");
    Require(colon != std::string::npos && colon > 0);
    request.headers.emplace_back(field.substr(0, colon), field.substr(colon + 2));
    const std::string name = LowerCase(field.substr(0, colon));
    Require(name != "transfer-encoding");
    if (name == "content-length") {
      length = std::stoul(field.substr(colon + 2));
    }
  }
  Require(wire.size() >= length);
  request.body = wire.substr(0, length);
  wire.erase(0, length);
  return request;
}

std::optional<std::string> HeaderOf(const WrittenRequest& request, const std::string& name) {
  std::optional<std::string> value;
  for (const auto& [found, text] : request.headers) {
    if (LowerCase(found) == LowerCase(name)) {
      Require(!value);
      value = text;
    }
  }
  return value;
}

}  // namespace Fuzz
