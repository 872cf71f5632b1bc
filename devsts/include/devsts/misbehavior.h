#ifndef DEVSTS_MISBEHAVIOR_H
#define DEVSTS_MISBEHAVIOR_H

#include <chrono>
#include <cstddef>
#include <functional>
#include <optional>
#include <string>
#include <utility>
#include <vector>

/// What the server does wrong on request. Members can be combined: those that choose an answer are
/// applied first, then those that change its form, then those about timing and the connection.
namespace DevSts {

/// A SOAP 1.1 fault (SOAP 1.1, section 4.4).
struct FaultAnswer {
  /// Namespace and local name of faultcode. If the namespace is empty, the code is written without
  /// a prefix.
  std::string codeNamespace;
  std::string codeName;
  std::string faultString;
  /// Omits the faultstring element.
  bool omitFaultString = false;
  int httpStatus = 500;
};

/// A complete HTTP answer. "Content-Length" is added unless `headers` contains it or
/// Transfer-Encoding, or chunks are requested.
struct HttpAnswer {
  int status = 200;
  std::string reason = "OK";
  std::vector<std::pair<std::string, std::string>> headers;
  std::string body;
};

/// Where the server stalls until the peer closes the connection or the server is stopped.
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

/// Changes the answer to a leg of a negotiation, unless the answer is a fault.
struct LegMisbehavior {
  /// Answers with this Context, which may be empty. The negotiation can be continued only in this
  /// Context; if it is empty, the negotiation cannot be continued.
  std::optional<std::string> context = {};
  /// Omits the Context attribute.
  bool omitContext = false;
  /// Answers with these octets in BinaryExchange, which may be empty.
  std::optional<std::string> leg = {};
  /// Omits the BinaryExchange.
  bool omitLeg = false;
  /// Sets no cookie but still requires it in the later legs.
  bool omitCookie = false;
  /// Forgets the negotiation.
  bool forget = false;
};

struct Misbehavior {
  /// Answers every request with this fault.
  std::optional<FaultAnswer> fault;
  /// Answers every request with this; takes precedence over `fault`.
  std::optional<HttpAnswer> httpAnswer;
  /// Sends exactly these octets instead of an HTTP answer, then keeps the connection open unless
  /// `closeConnection`; takes precedence over both.
  std::optional<std::string> rawAnswer;
  /// Sent before the answer (1xx answers, for example).
  std::string rawPrefix;
  /// Changes the SOAP envelope of every answer; may be called on several threads at once. If it
  /// throws, the connection is closed without an answer.
  std::function<void(std::string& envelope)> editEnvelope;
  /// Applies to requests that are legs of a negotiation and that the service itself answers.
  LegMisbehavior leg;
  /// The clock of the service is wrong by this much: in the Date, in what it accepts, and in
  /// tokens. The ages of negotiations are not affected.
  std::chrono::milliseconds clockOffset{0};

  /// Additional header fields of the answer; one Set-Cookie field for each of `setCookies`.
  std::vector<std::pair<std::string, std::string>> extraHeaders;
  std::vector<std::string> setCookies;
  /// Sends no Date, which an answer of the service otherwise has.
  bool omitDate = false;
  /// Adds header fields ("X-Padding-N") of about this many octets in total.
  std::size_t padHeaderBytes = 0;
  /// Appends this many spaces to the body.
  std::size_t padBodyBytes = 0;
  /// Sends the body in chunks of these sizes (RFC 9112, section 7.1); the last size is repeated as
  /// needed.
  std::vector<std::size_t> chunkSizes;
  /// Closes the connection after the answer and announces it ("Connection: close").
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
