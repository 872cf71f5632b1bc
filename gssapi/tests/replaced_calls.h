#ifndef SSOCLIENT_GSSAPI_TESTS_REPLACED_CALLS_H
#define SSOCLIENT_GSSAPI_TESTS_REPLACED_CALLS_H

#include <functional>
#include <string>

#include <gssapi/gssapi.h>

namespace SsoClient::Testing {

/// The result of a call of gss_init_sec_context.
struct InitResult {
  OM_uint32 major = GSS_S_COMPLETE;
  std::string output;
  OM_uint32 flags = 0;
};

/// During its lifetime, gss_init_sec_context runs the script instead of the library's function.
/// There must be only one at a time.
class InitSecContextScript {
 public:
  explicit InitSecContextScript(std::function<InitResult()> script);
  InitSecContextScript(const InitSecContextScript&) = delete;
  InitSecContextScript& operator=(const InitSecContextScript&) = delete;
  ~InitSecContextScript();

  InitResult Run() const { return script_(); }

 private:
  std::function<InitResult()> script_;
};

/// What the buffer contained that this thread released last with gss_release_buffer.
const std::string& LastReleasedBuffer();

}  // namespace SsoClient::Testing

#endif
