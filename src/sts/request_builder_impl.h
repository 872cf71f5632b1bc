#ifndef SSOCLIENT_STS_REQUEST_BUILDER_IMPL_H
#define SSOCLIENT_STS_REQUEST_BUILDER_IMPL_H

#include <string>

#include "sts/request_builder.h"

namespace SsoClient {

/// Builds unsigned requests for bearer tokens.
class RequestBuilderImpl final : public RequestBuilder {
 public:
  void BuildAcquireTokenRequest(const std::string& userName, const std::string& password,
                                const TokenSpec& spec, SoapRequest& request) const override;
};

}  // namespace SsoClient

#endif
