#include "service/library_log.h"

#include <mutex>
#include <ostream>
#include <string>
#include <vector>

#include <tarnik/service/log.h>

#include "output/safe_text.h"
#include "service/secret_search.h"

namespace SsoClient::Tool {
namespace {

using Tarnik::Service::LogRecord;

// The client's text, which never changes. Its condition is the opposite of what it says.
constexpr std::string_view kLastLeg =
    "GSS contract error: non-empty user leg after negotiation is complete";

}  // namespace

struct LibraryLog::Lines {
  std::mutex mutex{};
  std::vector<std::string> texts{};
};

LibraryLog::LibraryLog() : lines_(std::make_shared<Lines>()) {
  Tarnik::Service::SetLogSink([lines = lines_](const LogRecord& record) {
    const std::lock_guard guard(lines->mutex);
    lines->texts.emplace_back(record.text);
  });
}

LibraryLog::~LibraryLog() {
  Tarnik::Service::SetLogSink([](const LogRecord& /*record*/) {});
}

void LibraryLog::Print(const Console& console, std::string_view secret) const {
  const std::lock_guard guard(lines_->mutex);
  for (const std::string& text : lines_->texts) {
    if (text != kLastLeg && !ContainsSecret(text, secret)) {
      console.err << console.PaintError(Colour::kWarning, "ssoclient: ") << SafeText(console, text)
                  << '\n';
    }
  }
}

}  // namespace SsoClient::Tool
