#include "gss_error.h"

#include <ssoclient/exceptions.h>

#include "gss_handle.h"
#include "plain_text.h"

namespace SsoClient {

namespace {

std::string TextsOf(OM_uint32 code, int type) {
  std::string texts;
  OM_uint32 next = 0;
  do {
    OM_uint32 minor = 0;
    GssBuffer text;
    if (GSS_ERROR(gss_display_status(&minor, code, type, GSS_C_NO_OID, &next, text.Address())) !=
        0) {
      break;
    }
    texts += texts.empty() ? "" : ", ";
    texts += PlainText({static_cast<const char*>(text.Get().value), text.Get().length});
  } while (next != 0);
  return texts;
}

}  // namespace

void CheckGssStatus(const std::string& attempt, const GssStatus& status) {
  if (GSS_ERROR(status.major) == 0) {
    return;
  }
  std::string message = attempt + ": " + TextsOf(status.major, GSS_C_GSS_CODE);
  if (status.minor != 0) {
    message += " (" + TextsOf(status.minor, GSS_C_MECH_CODE) + ")";
  }
  throw SsoException(message + ".");
}

}  // namespace SsoClient
