#ifndef SSOCLIENT_STS_RESPONSE_HANDLER_H
#define SSOCLIENT_STS_RESPONSE_HANDLER_H

#include <string>
#include <vector>

#include <tarnik/core/reader.h>

namespace SsoClient {

/// The answer to one leg of an SPNEGO negotiation.
struct NegotiationResponse {
  std::string contextId;           ///< identifies the negotiation to the service
  std::vector<unsigned char> leg;  ///< the service's leg; empty when the answer has none
  std::string token;               ///< the assertion's canonical text; empty until it is issued
};

/// Reads the answers of a security token service. Each operation parses directly from the reader,
/// assigns its output only on success, and throws
///  - `InvalidCredentialsException` and `PasswordExpiredException` for a fault with that meaning;
///  - `ParseException` for a fault code with an undeclared prefix;
///  - `SsoException` for any other fault, and for an answer that is not well-formed or not of the
///    expected form.
///
/// Elements are found by their local names only: the first match in document order.
class ResponseHandler {
 public:
  /// The canonical text of the assertion in the answer to an Issue request
  /// (WS-Trust 1.3, section 4.4).
  virtual void ParseIssueResponse(Tarnik::Reader* response, std::string& assertion) const = 0;
  /// The status in the answer to a Validate request (WS-Trust 1.3, section 7): true when valid.
  virtual bool ParseValidateResponse(Tarnik::Reader* response) const = 0;
  /// The canonical text of the assertion in the answer to a Renew request
  /// (WS-Trust 1.3, section 5).
  virtual void ParseRenewResponse(Tarnik::Reader* response, std::string& assertion) const = 0;
  /// One leg of a negotiation (WS-Trust 1.3, section 8).
  virtual void ParseNegotiationResponse(Tarnik::Reader* response,
                                        NegotiationResponse& negotiation) const = 0;

 protected:
  ~ResponseHandler() = default;
};

/// Stateless; thread-safe.
class ResponseHandlerImpl final : public ResponseHandler {
 public:
  void ParseIssueResponse(Tarnik::Reader* response, std::string& assertion) const override;
  bool ParseValidateResponse(Tarnik::Reader* response) const override;
  void ParseRenewResponse(Tarnik::Reader* response, std::string& assertion) const override;
  void ParseNegotiationResponse(Tarnik::Reader* response,
                                NegotiationResponse& negotiation) const override;
};

}  // namespace SsoClient

#endif
