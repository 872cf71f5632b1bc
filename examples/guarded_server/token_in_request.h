#ifndef GUARDED_SERVER_TOKEN_IN_REQUEST_H
#define GUARDED_SERVER_TOKEN_IN_REQUEST_H

#include <optional>
#include <stdexcept>
#include <string>

#include <boost/beast/http.hpp>

namespace GuardedServer {

using Request = boost::beast::http::request<boost::beast::http::string_body>;
using Response = boost::beast::http::response<boost::beast::http::string_body>;

/// The request carries a token, but not in one of the forms below.
class MalformedRequest : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// The token of a request, as XML text; nothing if it has none. It is either
///  - in the header "Authorization: Bearer TOKEN" (RFC 6750, section 2.1), where TOKEN is the
///    Base64 text of the assertion, in either alphabet of RFC 4648, since both fit into the syntax
///    of that header; or
///  - in a SOAP message, as the only saml2:Assertion of its only wsse:Security header (WS-Security
///    SAML token profile 1.1, section 3.3). The signature of a message is not verified here: what
///    proves the possession of the token's key is the TLS connection.
/// Throws `MalformedRequest` for anything else, also for a token in both places.
std::optional<std::string> TokenIn(const Request& request);

}  // namespace GuardedServer

#endif
