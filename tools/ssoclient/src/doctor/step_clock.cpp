#include <optional>

#include "doctor/clock.h"
#include "doctor/steps.h"
#include "service/http_date.h"

namespace SsoClient::Tool::Doctor {

Step ExamineClock(Examination& examination) {
  Step step;
  const HttpAnswer& answer = *examination.answer;
  const std::optional<long> date = answer.date ? ParseHttpDate(*answer.date) : std::nullopt;
  if (!date) {
    step.finding = NotNeeded(
        "the answer has no Date that can be read, so the clocks cannot be "
        "compared");
    return step;
  }
  const ClockOffset offset = OffsetOf(*date, answer.sentAt, answer.receivedAt);
  step.finding = FindingOfClock(offset);
  step.details = {{"offsetSeconds", offset.seconds},
                  {"uncertaintySeconds", offset.uncertainty},
                  {"date", *answer.date}};
  return step;
}

}  // namespace SsoClient::Tool::Doctor
