#include "kerberos/negotiated_login.h"

#include "kerberos/gss_library.h"
#include "kerberos/spnego_token.h"
#include "soap/fault.h"

namespace DevSts {

Octets NegotiatedLogin::Take(const Octets& leg) {
  ++legs_;
  if (legs_ == script_.failAtLeg) {
    throw Fault(script_.failure);
  }
  try {
    Octets answer = TakeByStage(leg);
    // An answer without a token must contain a leg.
    return answer.empty() && !IsDone() ? WriteResponse(NegState::AcceptIncomplete) : answer;
  } catch (const SpnegoError& error) {
    ThrowInvalidRequest(std::string("The leg is not readable: ") + error.what());
  } catch (const GssError& error) {
    const std::string text = std::string("The negotiation failed: ") + error.what();
    if (error.RoutineError() == GSS_S_DEFECTIVE_TOKEN) {
      ThrowInvalidRequest(text);
    }
    ThrowFailedAuthentication(text);
  }
}

Octets NegotiatedLogin::TakeByStage(const Octets& leg) {
  if (stage_ == Stage::Mechanism) {
    return TakeMechanismLeg(leg);
  }
  return stage_ == Stage::Signature ? TakeSignature(leg) : TakeMore();
}

Octets NegotiatedLogin::TakeMechanismLeg(const Octets& leg) {
  // With an empty leg, the library would start another protocol, in which it sends the first
  // message.
  if (leg.empty()) {
    ThrowInvalidRequest("The BinaryExchange contains no leg");
  }
  const bool isFirst = legs_ == 1;
  Octets answer = login_.Take(leg);
  if (!login_.IsDone()) {
    return answer;
  }
  if (isFirst && script_.requestMic) {
    mechTypes_ = MechTypesIn(leg);
    stage_ = Stage::Signature;
    return WithMic(answer, NegState::AcceptIncomplete, login_.MicOf(mechTypes_));
  }
  EndLogin();
  return answer;
}

Octets NegotiatedLogin::TakeSignature(const Octets& leg) {
  const Octets mic = MicIn(leg);
  if (mic.empty()) {
    ThrowFailedAuthentication("The signature of the list of mechanisms is missing");
  }
  login_.VerifyMic(mechTypes_, mic);
  EndLogin();
  return {};
}

Octets NegotiatedLogin::TakeMore() {
  if (++moreTaken_ == script_.moreLegs) {
    stage_ = Stage::Done;
  }
  return {};
}

void NegotiatedLogin::EndLogin() {
  stage_ = script_.moreLegs > 0 ? Stage::More : Stage::Done;
}

}  // namespace DevSts
