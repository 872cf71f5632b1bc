#ifndef SSOCLIENT_TESTS_STS_PARSE_ANSWERS_H
#define SSOCLIENT_TESTS_STS_PARSE_ANSWERS_H

#include <functional>
#include <string>
#include <typeinfo>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <tarnik/core/reader.h>

#include "sts/answers.h"
#include "sts/response_handler.h"

namespace SsoClient::Testing {

inline constexpr char kFormat[] = "Unexpected XML format";

inline constexpr char kSamlType[] =
    "<wst:TokenType>urn:oasis:names:tc:SAML:2.0:assertion</wst:TokenType>";

/// Parses the answer to a leg. Throws as `ResponseHandler::ParseNegotiationResponse` does.
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

/// An answer that is not the last one of its negotiation.
inline std::string IntermediateAnswer(const std::string& exchange) {
  return Envelope(Rstr(exchange, " Context=\"urn:uuid:1\""));
}

/// The last answer of a negotiation.
inline std::string FinalAnswer(const std::string& content) {
  return Envelope(Collection(Rstr(content, " Context=\"urn:uuid:1\"")));
}

/// A leg of the bytes 0x00, 0xFF and 0x10.
inline constexpr char kExchange[] = "<wst:BinaryExchange>AP8Q</wst:BinaryExchange>";

}  // namespace SsoClient::Testing

#endif
