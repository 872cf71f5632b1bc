#include <ssoclient/gssapi_negotiation_handler.h>
#include <tarnik/core/exception.h>

#include "gssapi_negotiation_handler_impl.h"

namespace SsoClient {

namespace {

void Require(bool condition, const std::string& demand) {
  if (!condition) {
    throw Tarnik::InvalidArgumentException("GssapiNegotiationConfig: " + demand);
  }
}

// A principal's own form, "service/host@REALM", would be taken for something else.
bool IsServiceAtHost(const std::string& name) {
  const auto at = name.find('@');
  return at != std::string::npos && at != 0 && at + 1 != name.size() && name.rfind('@') == at &&
         name.find('/') == std::string::npos;
}

void RequireNoNul(const std::string& text, const char* field) {
  Require(text.find('\0') == std::string::npos,
          std::string("the ") + field + " must not hold a NUL.");
}

}  // namespace

std::shared_ptr<GssapiNegotiationHandler> CreateGssapiNegotiationHandler(
    const GssapiNegotiationConfig& config) {
  Require(!config.targetService.empty(), "the target service must not be empty.");
  RequireNoNul(config.targetService, "target service");
  RequireNoNul(config.principal, "principal");
  RequireNoNul(config.keytab, "keytab");
  RequireNoNul(config.credentialCache, "credential cache");
  Require(IsServiceAtHost(config.targetService),
          "the target service `" + config.targetService + "' is not of the form service@host.");
  return std::make_shared<GssapiNegotiationHandlerImpl>(config);
}

}  // namespace SsoClient
