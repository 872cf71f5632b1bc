#include "doctor/library_connection.h"

#include <future>
#include <memory>

#include <tarnik/core/checked_cast.h>
#include <tarnik/ssl/ssl_exception.h>

namespace SsoClient::Tool::Doctor {
namespace {

LibraryVerdict VerdictOf(const Tarnik::Exception* failure) {
  if (failure == nullptr) {
    return {LibraryVerdict::Kind::kAccepted, ""};
  }
  const bool isTls = dynamic_cast<const Tarnik::Ssl::SSLException*>(failure) != nullptr;
  return {isTls ? LibraryVerdict::Kind::kRefused : LibraryVerdict::Kind::kUndecided,
          failure->what()};
}

}  // namespace

Tarnik::Ref<Tarnik::Http::ConnectionSpec> MakeConnectionSpec(const Examination& examination) {
  return Tool::MakeConnectionSpec(examination.service, examination.sslContext.get(),
                                  examination.plan.peerName);
}

LibraryVerdict AskLibrary(const Examination& examination, TimeLimit::Clock::time_point end) {
  const auto spec = MakeConnectionSpec(examination);
  // Owned by the completion too, which may run after this function has returned.
  const auto verdict = std::make_shared<std::promise<LibraryVerdict>>();
  std::future<LibraryVerdict> answer = verdict->get_future();
  const auto pending =
      Tarnik::CheckedCast<Tarnik::Http::CustomConnectionSpec>(spec.get())
          ->StartConnect([verdict](Tarnik::System::Stream* stream, Tarnik::Exception* failure) {
            verdict->set_value(VerdictOf(failure));
            if (stream != nullptr) {
              stream->Close();
            }
          });
  if (answer.wait_until(end) == std::future_status::ready) {
    return answer.get();
  }
  pending->Cancel();
  return {LibraryVerdict::Kind::kUndecided, "the connection of the library has timed out"};
}

}  // namespace SsoClient::Tool::Doctor
