#ifndef SSOCLIENT_TESTS_STS_PARSE_ANSWERS_H
#define SSOCLIENT_TESTS_STS_PARSE_ANSWERS_H

#include <functional>
#include <string>
#include <typeinfo>

#include <gtest/gtest.h>
#include <ssoclient/exceptions.h>
#include <tarnik/core/reader.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "sts/answers.h"
#include "sts/response_handler.h"

namespace SsoClient::Testing {

inline constexpr char kFormat[] = "Unexpected XML format";

inline constexpr char kSamlType[] =
    "<wst:TokenType>urn:oasis:names:tc:SAML:2.0:assertion</wst:TokenType>";

inline NegotiationResponse ParseNegotiation(const std::string& answer) {
  NegotiationResponse response;
  ResponseHandlerImpl().ParseNegotiationResponse(Tarnik::CreateStringReader(answer).get(),
                                                 response);
  return response;
}

/// The message of the plain SsoException that `parse` throws.
inline std::string Failure(const std::function<void()>& parse) {
  try {
    parse();
  } catch (const SsoException& error) {
    EXPECT_EQ(typeid(error), typeid(SsoException));
    return error.Message();
  }
  return "no failure";
}

inline std::string IntermediateAnswer(const std::string& exchange) {
  return Envelope(Rstr(exchange, " Context=\"urn:uuid:1\""));
}
inline std::string FinalAnswer(const std::string& content) {
  return Envelope(Collection(Rstr(content, " Context=\"urn:uuid:1\"")));
}

inline constexpr char kExchange[] = "<wst:BinaryExchange>AP8Q</wst:BinaryExchange>";

}  // namespace SsoClient::Testing

#endif
