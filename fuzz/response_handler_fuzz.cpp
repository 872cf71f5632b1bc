// Every answer ends in a result or in one of the stated exceptions, with each of the four parsers.
#include <tarnik/core/exception.h>
#include <tarnik/core/reader.h>

#include "input.h"
#include "sts/response_handler_impl.h"

namespace {

template <class Parse>
void Try(const std::string& text, Parse parse) {
  const auto reader = Tarnik::CreateStringReader(text);
  try {
    parse(reader.get());
  } catch (const Tarnik::Exception&) {
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text = Fuzz::TextOf(data, size);
  const SsoClient::ResponseHandlerImpl handler;
  Try(text, [&](Tarnik::Reader* reader) {
    std::string assertion;
    handler.ParseIssueResponse(reader, assertion);
    Fuzz::Require(!assertion.empty());
  });
  Try(text, [&](Tarnik::Reader* reader) { handler.ParseValidateResponse(reader); });
  Try(text, [&](Tarnik::Reader* reader) {
    std::string assertion;
    handler.ParseRenewResponse(reader, assertion);
    Fuzz::Require(!assertion.empty());
  });
  Try(text, [&](Tarnik::Reader* reader) {
    SsoClient::NegotiationResponse response;
    handler.ParseNegotiationResponse(reader, response);
  });
  return 0;
}
