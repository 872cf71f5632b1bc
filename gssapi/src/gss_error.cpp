#include "gss_error.h"

#include <ssoclient/exceptions.h>

#include <string_view>

#include "gss_handle.h"

namespace SsoClient {

namespace {

// Some texts end in blanks and a NUL.
std::string_view Trimmed(std::string_view text) {
  const auto last = text.find_last_not_of(std::string_view(" \n\0", 3));
  return text.substr(0, last == std::string_view::npos ? 0 : last + 1);
}

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
    texts += Trimmed({static_cast<const char*>(text.Get().value), text.Get().length});
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
