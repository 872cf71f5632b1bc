#include "doctor/harmless_request.h"
#include "doctor/steps.h"

namespace SsoClient::Tool::Doctor {

Step ExamineSts(Examination& examination) {
  Step step;
  step.finding = FindingOfSoapAnswer(examination.answer->body);
  return step;
}

}  // namespace SsoClient::Tool::Doctor
