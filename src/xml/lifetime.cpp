#include "xml/lifetime.h"

#include <tarnik/system/date_time.h>

#include "xml/builder_factories.h"
#include "xml/namespaces.h"
#include "xml/xml_date_time.h"

namespace SsoClient {

std::shared_ptr<XMLCompositeBuilder> BuildLifetime(std::int64_t seconds) {
  constexpr long kMicrosecondsPerSecond = 1'000'000;
  const auto now = Tarnik::System::GetUtcDateTime();
  const long distance = Tarnik::System::SaturatingMultiply(seconds, kMicrosecondsPerSecond);
  const auto expires = Tarnik::System::DateTimeFromUtc(
      Tarnik::System::SaturatingAdd(distance, now.GetUtcTime()), false);

  auto lifetime = MakeCompositeBuilder("wst", "Lifetime", {{"xmlns:wsu", kWsuNamespace}});
  lifetime->Add(MakeTextElementBuilder("wsu", "Created", FormatXmlDateTime(now)))
      .Add(MakeTextElementBuilder("wsu", "Expires", FormatXmlDateTime(expires)));
  return lifetime;
}

}  // namespace SsoClient
