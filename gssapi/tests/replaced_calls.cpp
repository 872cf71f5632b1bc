#include "replaced_calls.h"

#include <atomic>
#include <cstdlib>
#include <cstring>
#include <utility>

namespace {

thread_local std::string lastReleased;

std::atomic<const SsoClient::Testing::InitSecContextScript*> current{nullptr};

// The library frees the copy.
void Copy(const std::string& text, gss_buffer_t buffer) {
  if (text.empty()) {
    return;
  }
  buffer->value = std::malloc(text.size());
  buffer->length = text.size();
  std::memcpy(buffer->value, text.data(), text.size());
}

}  // namespace

// The linker redirects calls to the __wrap_ functions; the library's functions are the __real_
// ones.
extern "C" {

OM_uint32 __real_gss_init_sec_context(OM_uint32*, gss_cred_id_t, gss_ctx_id_t*, gss_name_t, gss_OID,
                                      OM_uint32, OM_uint32, gss_channel_bindings_t, gss_buffer_t,
                                      gss_OID*, gss_buffer_t, OM_uint32*, OM_uint32*);

OM_uint32 __wrap_gss_init_sec_context(OM_uint32* minor, gss_cred_id_t credentials,
                                      gss_ctx_id_t* context, gss_name_t target, gss_OID mechanism,
                                      OM_uint32 flags, OM_uint32 lifetime,
                                      gss_channel_bindings_t bindings, gss_buffer_t input,
                                      gss_OID* actual, gss_buffer_t output, OM_uint32* granted,
                                      OM_uint32* grantedLifetime) {
  const auto* script = current.load();
  if (script == nullptr) {
    return __real_gss_init_sec_context(minor, credentials, context, target, mechanism, flags,
                                       lifetime, bindings, input, actual, output, granted,
                                       grantedLifetime);
  }
  const auto result = script->Run();
  *minor = 0;
  *granted = result.flags;
  Copy(result.output, output);
  return result.major;
}

OM_uint32 __real_gss_release_buffer(OM_uint32*, gss_buffer_t);

OM_uint32 __wrap_gss_release_buffer(OM_uint32* minor, gss_buffer_t buffer) {
  lastReleased.assign(static_cast<const char*>(buffer->value), buffer->length);
  return __real_gss_release_buffer(minor, buffer);
}
}

namespace SsoClient::Testing {

InitSecContextScript::InitSecContextScript(std::function<InitResult()> script)
    : script_(std::move(script)) {
  current = this;
}

InitSecContextScript::~InitSecContextScript() {
  current = nullptr;
}

const std::string& LastReleasedBuffer() {
  return lastReleased;
}

}  // namespace SsoClient::Testing
