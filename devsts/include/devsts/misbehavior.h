#ifndef DEVSTS_MISBEHAVIOR_H
#define DEVSTS_MISBEHAVIOR_H

#include <chrono>
#include <cstddef>
#include <functional>
#include <optional>
#include <string>
#include <utility>
#include <vector>

/// What the server can be told to do wrong. Members combine: an answer is chosen, then sent by the
/// rules about its shape, then by those about time and the connection.
namespace DevSts {

/// A SOAP 1.1 fault (SOAP 1.1, section 4.4).
struct FaultAnswer {
  /// Namespace and local name of faultcode; an empty namespace writes the code without a prefix.
  std::string codeNamespace;
  std::string codeName;
  std::string faultString;
  /// Writes no faultstring element at all.
  bool omitFaultString = false;
  int httpStatus = 500;
};

/// A complete HTTP answer. "Content-Length" is added unless `headers` names it or
/// Transfer-Encoding, or chunks are asked for.
struct HttpAnswer {
  int status = 200;
  std::string reason = "OK";
  std::vector<std::pair<std::string, std::string>> headers;
  std::string body;
};

/// Where the server stops until the peer closes or the server is stopped.
enum class Stall {
  None,
  BeforeTlsHandshake,  ///< the TCP connection is accepted, nothing is read
  BeforeRequest,       ///< the handshake is done, the request is not read
  BeforeAnswer,        ///< the request is read
  AfterHeaders,        ///< the answer's head is sent
  InMidBody,           ///< half of the answer's body is sent
};

/// How a connection ends early.
enum class CutStyle {
  Orderly,        ///< TLS close_notify (if TLS), then FIN
  WithoutNotice,  ///< FIN without a TLS close_notify
  Reset,          ///< RST
};

struct CutOff {
  /// Octets of the answer (head and body, before encryption) that are sent first.
  std::size_t afterBytes = 0;
  CutStyle style = CutStyle::Orderly;
};

struct Drip {
  std::size_t bytes = 1;                    ///< octets at a time, at least 1
  std::chrono::milliseconds interval{100};  ///< pause between them
};

/// What is wrong with the answer to a leg of a negotiation that is not answered with a fault.
struct LegMisbehavior {
  /// Answers with this Context, empty as well. If the negotiation goes on, it does so by this
  /// Context alone; with an empty one, it does not.
  std::optional<std::string> context = {};
  /// Writes no Context at all.
  bool omitContext = false;
  /// Answers with these octets in BinaryExchange, none as well.
  std::optional<std::string> leg = {};
  /// Writes no BinaryExchange.
  bool omitLeg = false;
  /// Sets no cookie, and yet demands it.
  bool omitCookie = false;
  /// Forgets the negotiation.
  bool forget = false;
};

struct Misbehavior {
  /// Answers with this fault, whatever the request.
  std::optional<FaultAnswer> fault;
  /// Answers with this, whatever the request; preferred to `fault`.
  std::optional<HttpAnswer> httpAnswer;
  /// Sends exactly these octets in place of an HTTP answer, then keeps the connection unless
  /// `closeConnection`; preferred to both.
  std::optional<std::string> rawAnswer;
  /// Sent in front of the answer (1xx answers, for instance).
  std::string rawPrefix;
  /// Changes the SOAP envelope of whatever is answered; may run on several threads at once.
  /// If it throws, the connection is closed without an answer.
  std::function<void(std::string& envelope)> editEnvelope;
  /// For a request that is a leg of a negotiation and is answered by the service.
  LegMisbehavior leg;

  /// Further header fields of the answer; one Set-Cookie field for each of `setCookies`.
  std::vector<std::pair<std::string, std::string>> extraHeaders;
  std::vector<std::string> setCookies;
  /// Adds header fields of about this many octets in all ("X-Padding-N").
  std::size_t padHeaderBytes = 0;
  /// Adds this many blanks after the body's text.
  std::size_t padBodyBytes = 0;
  /// Sends the body in chunks of these sizes (RFC 9112, section 7.1), the last size repeated as
  /// needed.
  std::vector<std::size_t> chunkSizes;
  /// Announces and does close the connection after the answer.
  bool closeConnection = false;
  /// Closes the connection after the answer without announcing it.
  bool closeUnannounced = false;

  std::chrono::milliseconds delayBeforeAnswer{0};
  Stall stall = Stall::None;
  std::optional<Drip> drip;
  std::optional<CutOff> cutOff;
};

}  // namespace DevSts

#endif
