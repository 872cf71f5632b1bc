#include <strings.h>

#include <algorithm>

#include "devsts/server.h"

namespace DevSts {
namespace {

bool IsNamed(const std::pair<std::string, std::string>& field, const std::string& name) {
  return strcasecmp(field.first.c_str(), name.c_str()) == 0;
}

}  // namespace

std::string ReceivedRequest::Header(const std::string& name) const {
  const auto found = std::find_if(headers.begin(), headers.end(),
                                  [&](const auto& field) { return IsNamed(field, name); });
  return found != headers.end() ? found->second : std::string();
}

std::size_t ReceivedRequest::HeaderCount(const std::string& name) const {
  return static_cast<std::size_t>(std::count_if(
      headers.begin(), headers.end(), [&](const auto& field) { return IsNamed(field, name); }));
}

}  // namespace DevSts
