#include "xml/security_header.h"

#include <tarnik/system/date_time.h>

#include "xml/builder_factories.h"
#include "xml/namespaces.h"
#include "xml/xml_date_time.h"

namespace SsoClient {

std::shared_ptr<XMLCompositeBuilder> BuildSecurityHeader(std::uint32_t minutes) {
  const auto now = Tarnik::System::GetUtcDateTime();
  const auto expires = AddMinutes(now, minutes);

  auto timestamp = MakeCompositeBuilder("wsu", "Timestamp", {{"xmlns:wsu", kWsuNamespace}});
  timestamp->Add(MakeTextElementBuilder("wsu", "Created", FormatXmlDateTime(now)))
      .Add(MakeTextElementBuilder("wsu", "Expires", FormatXmlDateTime(expires)));
  auto security = MakeCompositeBuilder("wsse", "Security", {{"xmlns:wsse", kWsseNamespace}});
  security->Add(timestamp);
  return security;
}

}  // namespace SsoClient
