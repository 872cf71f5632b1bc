#ifndef SSOCLIENT_TRANSPORT_SOAP_REQUEST_H
#define SSOCLIENT_TRANSPORT_SOAP_REQUEST_H

#include <string>

#include <tarnik/text/string_util.h>

namespace SsoClient {

/// What a session posts. Not copied, and its body is cleansed from memory when it dies, since it
/// holds passwords and tokens.
struct SoapRequest {
  std::string action;  ///< the SOAPAction URI, without quotes
  std::string body;    ///< the whole serialised envelope

  SoapRequest() = default;
  SoapRequest(const SoapRequest&) = delete;
  SoapRequest& operator=(const SoapRequest&) = delete;
  ~SoapRequest() { Tarnik::StringUtil::Cleanse(body); }
};

}  // namespace SsoClient

#endif
