#ifndef DEVSTS_REQUEST_TEXT_H
#define DEVSTS_REQUEST_TEXT_H

#include <string>

namespace DevSts::Testing {

inline constexpr char kIssueAction[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue";

inline constexpr char kRenewAction[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Renew";
inline constexpr char kValidateAction[] =
    "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Validate";

// The wst:UseKey of requests for a holder-of-key token.
inline constexpr char kUseKey[] = "<wst:UseKey Sig=\"holderOfKeyProofSignature\"/>";

// The wst:RequestSecurityToken of an Issue request: lifetime of an hour, renewable, delegable.
// `keyType` is "Bearer" or "PublicKey"; `more` is inserted after wst:Delegatable.
std::string IssueBody(const std::string& keyType, const std::string& more = "");
std::string RenewBody(const std::string& assertion, long seconds = 7200);
std::string ValidateBody(const std::string& assertion);

std::string DelegateTo(const std::string& user);
std::string ActAs(const std::string& assertion);

std::string UsernameToken(const std::string& user, const std::string& password);
std::string Timestamp(long created = 0, long expires = 600);

// An unsigned envelope with these tokens after the Timestamp.
std::string Envelope(const std::string& tokens, const std::string& body);

// An Issue request for a bearer token that the service accepts: lifetime of an hour, renewable,
// delegable. `more` is inserted after wst:Delegatable.
std::string IssueEnvelope(const std::string& user, const std::string& password,
                          const std::string& more = "");

// The same for alice.
std::string AliceEnvelope(const std::string& more = "");

// Replaces the first occurrence. Throws if the text does not occur.
std::string Replaced(std::string text, const std::string& from, const std::string& to);

// The text of the answer's first element of this name, prefix included; empty if it is absent.
std::string ElementText(const std::string& xml, const std::string& name);

// The markup of the answer's assertion.
std::string AssertionIn(const std::string& answer);

// xs:dateTime this many seconds from now.
std::string TimeFromNow(long seconds);

}  // namespace DevSts::Testing

#endif
