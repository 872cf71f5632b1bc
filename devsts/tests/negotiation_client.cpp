#include "negotiation_client.h"

#include <algorithm>
#include <atomic>
#include <stdexcept>

#include <openssl/evp.h>

#include "raw_client.h"

namespace DevSts::Testing {
namespace {

constexpr char kExchangeStart[] =
    "<wst:BinaryExchange EncodingType=\"http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-soap-message-security-1.0#Base64Binary\" "
    "ValueType=\"http://schemas.xmlsoap.org/ws/2005/02/trust/spnego\">";

std::string NewContext() {
  static std::atomic<unsigned> last{0};
  return "urn:uuid:" + std::to_string(++last);
}

// The name and value of the Set-Cookie field.
std::string CookieIn(const std::string& answer) {
  const std::string field = "\r\nSet-Cookie: ";
  const std::size_t start = answer.find(field);
  if (start == std::string::npos || start > answer.find("\r\n\r\n")) {
    return {};
  }
  const std::size_t from = start + field.size();
  return answer.substr(from, answer.find_first_of(";\r", from) - from);
}

}  // namespace

std::string ToBase64(const std::string& octets) {
  std::string text(4 * ((octets.size() + 2) / 3) + 1, '\0');
  const int size = EVP_EncodeBlock(reinterpret_cast<unsigned char*>(text.data()),
                                   reinterpret_cast<const unsigned char*>(octets.data()),
                                   static_cast<int>(octets.size()));
  text.resize(static_cast<std::size_t>(size));
  return text;
}

std::string FromBase64(const std::string& text) {
  std::string octets(text.size() / 4 * 3 + 1, '\0');
  const int size = EVP_DecodeBlock(reinterpret_cast<unsigned char*>(octets.data()),
                                   reinterpret_cast<const unsigned char*>(text.data()),
                                   static_cast<int>(text.size()));
  if (size < 0) {
    throw std::runtime_error("not Base64: " + text);
  }
  const auto padding = std::count(text.begin(), text.end(), '=');
  octets.resize(static_cast<std::size_t>(size - padding));
  return octets;
}

std::string Exchange(const std::string& octets) {
  return kExchangeStart + ToBase64(octets) + "</wst:BinaryExchange>";
}

std::string FirstLegBody(const std::string& context, const std::string& leg,
                         const std::string& keyType, const std::string& more) {
  return Replaced(IssueBody(keyType, more + Exchange(leg)), "<wst:RequestSecurityToken",
                  "<wst:RequestSecurityToken Context=\"" + context + "\"");
}

std::string LaterLegBody(const std::string& context, const std::string& leg) {
  return "<wst:RequestSecurityTokenResponse Context=\"" + context + "\">" + Exchange(leg) +
         "</wst:RequestSecurityTokenResponse>";
}

std::string ContextIn(const std::string& answer) {
  const std::string attribute = " Context=\"";
  const std::size_t start = answer.find(attribute);
  if (start == std::string::npos) {
    return "none";
  }
  const std::size_t from = start + attribute.size();
  return answer.substr(from, answer.find('"', from) - from);
}

std::string LegIn(const std::string& answer) {
  return FromBase64(ElementText(answer, "wst:BinaryExchange"));
}

NegotiationClient::NegotiationClient(const Server& server)
    : context(NewContext()), server_(server) {}

std::string NegotiationClient::SendFirst(const std::string& leg, const std::string& more) {
  return SendFirstEnvelope(Envelope("", FirstLegBody(context, leg, "Bearer", more)));
}

std::string NegotiationClient::SendFirstEnvelope(const std::string& envelope) {
  std::string answer = Send(envelope, kIssueAction);
  cookie = CookieIn(answer);
  return answer;
}

std::string NegotiationClient::SendNext(const std::string& leg) {
  return Send(Envelope("", LaterLegBody(context, leg)), kContinueAction);
}

std::string NegotiationClient::Send(const std::string& envelope, const std::string& action) const {
  std::string request = PostOf(envelope, action);
  if (!cookie.empty()) {
    request = Replaced(request, "Host:", "Cookie: " + cookie + "\r\nHost:");
  }
  RawClient client(server_.HttpPort());
  client.Send(request);
  return client.ReadAnswer();
}

}  // namespace DevSts::Testing
