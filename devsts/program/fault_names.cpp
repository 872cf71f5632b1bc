#include "fault_names.h"

#include <array>
#include <cstddef>
#include <stdexcept>
#include <utility>

#include "value_forms.h"

namespace DevSts::Program {
namespace {

constexpr std::array<std::pair<const char*, const char*>, 4> kPrefixes{{
    {"soap", "http://schemas.xmlsoap.org/soap/envelope/"},
    {"wst", "http://docs.oasis-open.org/ws-sx/ws-trust/200512"},
    {"wsse", "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd"},
    {"wsu", "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd"},
}};

}  // namespace

void SetFaultCode(const std::string& text, FaultAnswer& fault) {
  const bool hasNamespace = text.rfind('{', 0) == 0;
  const std::size_t colon = hasNamespace ? text.rfind('}') : text.find(':');
  fault.codeNamespace.clear();
  fault.codeName = colon == std::string::npos ? text : text.substr(colon + 1);
  if (hasNamespace && colon != std::string::npos) {
    fault.codeNamespace = text.substr(1, colon - 1);
  } else if (colon != std::string::npos) {
    for (const auto& [prefix, uri] : kPrefixes) {
      if (text.substr(0, colon) == prefix) {
        fault.codeNamespace = uri;
      }
    }
  }
  if (fault.codeName.empty() || fault.codeName[0] == '{' ||
      (colon != std::string::npos && fault.codeNamespace.empty())) {
    throw std::invalid_argument("'" + text +
                                "' is not PREFIX:NAME with the prefix soap, wst, wsse or wsu, "
                                "{NAMESPACE}NAME or NAME");
  }
}

int HttpStatusFrom(const std::string& value) {
  const auto status = static_cast<int>(NumberFrom(value, 999));
  if (status < 100) {
    throw std::invalid_argument("'" + value + "' is not a status of HTTP");
  }
  return status;
}

}  // namespace DevSts::Program
