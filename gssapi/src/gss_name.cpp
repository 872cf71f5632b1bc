#include "gss_name.h"

#include "gss_error.h"

namespace SsoClient {

void ImportGssName(const std::string& text, gss_OID type, GssName& name) {
  gss_buffer_desc buffer{text.size(), const_cast<char*>(text.data())};
  GssStatus status;
  status.major = gss_import_name(&status.minor, &buffer, type, name.Address());
  CheckGssStatus("The name `" + text + "' cannot be read", status);
}

}  // namespace SsoClient
