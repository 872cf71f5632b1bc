#ifndef DEVSTS_REQUEST_TEXT_H
#define DEVSTS_REQUEST_TEXT_H

#include <string>

namespace DevSts::Testing {

inline constexpr char kIssueAction[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue";

// An Issue request for a bearer token that the service accepts: lifetime an hour, renewable,
// delegable. `more` stands behind wst:Delegatable.
std::string IssueEnvelope(const std::string& user, const std::string& password,
                          const std::string& more = "");

// The same for alice.
std::string AliceEnvelope(const std::string& more = "");

// Replaces the first occurrence, which must be there.
std::string Replaced(std::string text, const std::string& from, const std::string& to);

// The text of the answer's first element of this name, prefix included; empty if there is none.
std::string ElementText(const std::string& xml, const std::string& name);

// The markup of the answer's assertion.
std::string AssertionIn(const std::string& answer);

// xs:dateTime this many seconds from now.
std::string TimeFromNow(long seconds);

}  // namespace DevSts::Testing

#endif
