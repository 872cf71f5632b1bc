#ifndef DEVSTS_SERVER_H
#define DEVSTS_SERVER_H

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "devsts/certificates.h"
#include "devsts/misbehavior.h"
#include "devsts/negotiation.h"
#include "devsts/users.h"
#include "devsts/xml_security.h"

/// A small WS-Trust 1.3 Security Token Service for tests and demonstrations.
namespace DevSts {

/// What is right or wrong with the TLS server certificate.
enum class ServerCertificate {
  Valid,                ///< localhost, 127.0.0.1 and ::1 as alternative names, issued by the CA
  ThroughIntermediate,  ///< the same, issued by an intermediate CA that is sent along
  MissingIntermediate,  ///< issued by an intermediate CA that is not sent
  Expired,
  NotYetValid,
  SelfSigned,
  WrongHost,             ///< for elsewhere.example only
  NameOnlyInCommonName,  ///< common name localhost, no alternative names
  AddressAsDnsName,      ///< the addresses stand in dNSName entries, localhost does not
  NulInName,             ///< dNSName "localhost", NUL, ".elsewhere.example"
  Custom,  ///< `TlsOptions::dnsNames` and `addresses`, issued by the CA (wildcards, for instance)
};

enum class TlsProtocol {
  Modern,  ///< TLS 1.2 and 1.3
  Tls12Only,
  Tls11Only,
  AnonymousSuites,  ///< TLS 1.2 with cipher suites that authenticate nobody
};

struct TlsOptions {
  ServerCertificate certificate = ServerCertificate::Valid;
  std::vector<std::string> dnsNames;
  std::vector<std::string> addresses;
  TlsProtocol protocol = TlsProtocol::Modern;
  /// Asks for a certificate issued by the CA (see `Server::MakeClientCredential`) and refuses peers
  /// without one.
  bool requireClientCertificate = false;
  /// Hands out TLS session tickets.
  bool sessionResumption = true;
};

struct ReceivedRequest;

/// Shape of the assertions that are issued.
struct AssertionOptions {
  /// The exclusive form's prefix list has the prefixes that stand in xsi:type values only. A token
  /// signed in inclusive form is found forged when it comes back inside a request.
  SignOptions signing = DefaultSigning();
  /// Key type of the signing certificate; ECDSA algorithms need an EC key.
  KeyType signingKey = KeyType::Rsa2048;
  /// Declares the assertion's namespaces on the SOAP envelope in place of the assertion.
  bool inheritNamespaces = false;
  /// Writes line ends and indentation between elements.
  bool indent = false;
  /// Writes a Format attribute on Issuer.
  bool issuerFormat = true;
  /// Writes xsi:type="xs:string" on AttributeValue.
  bool attributeValueTypes = true;
  /// Count of RenewRestrictionType and ProxyRestriction when a renewable or delegable token is
  /// asked for.
  unsigned renewCount = 10;
  unsigned proxyCount = 10;
  /// Postdatable and RenewExpired of RenewRestrictionType: whether a renewal may begin in the
  /// future, and whether it may follow the token's end.
  bool postdatable = false;
  bool renewExpired = false;
  /// Longest lifetime that is granted.
  std::chrono::seconds maxLifetime{30L * 24 * 3600};
  /// Conditions start this long before now.
  std::chrono::seconds notBeforeOffset{0};
  /// Changes the assertion's text before it is signed. A ds:Signature in it is used as the
  /// template. May run on several threads at once, as the next one.
  std::function<void(std::string& assertion)> beforeSigning;
  /// Changes the assertion's text as it stands in the answer, after it was signed.
  std::function<void(std::string& assertion)> afterSigning;

  static SignOptions DefaultSigning() {
    SignOptions options;
    options.inclusivePrefixes = {"del", "rsa", "xs"};
    return options;
  }
};

struct ServerOptions {
  /// The numeric loopback address to listen on, "127.0.0.1" or "::1".
  std::string address = "127.0.0.1";
  /// 0 takes a free port.
  std::uint16_t httpPort = 0;
  std::uint16_t httpsPort = 0;
  Users users = DemoUsers();
  /// Host of the vendor's namespaces and attribute names.
  std::string vendorHost = "sts-vendor.example";
  /// Host of the solution-user attribute's name.
  std::string solutionHost = "sso.example";
  /// Text of the assertions' Issuer.
  std::string issuer = "https://sts.example.com/STS";
  /// How far the clocks may differ when a request's Timestamp is judged.
  std::chrono::seconds clockSkew{60};
  AssertionOptions assertion;
  TlsOptions tls;
  NegotiationOptions negotiation;
  /// Remembers at most this many issued tokens (the oldest are forgotten first). A forgotten token
  /// is refused.
  std::size_t issuedTokenLimit = 8192;
  /// Keeps at most this many requests in the log (the oldest go first).
  std::size_t requestLogLimit = 4096;
  /// Called once per request after its answer is decided, on the connection's thread.
  std::function<void(const ReceivedRequest&)> onRequest;
};

/// How a request is signed, by the form of what its ds:KeyInfo refers to.
enum class RequestSignature {
  None,
  ByCertificate,  ///< a BinarySecurityToken (X.509 Token Profile 1.1, section 3.2)
  ByToken,        ///< an assertion's ID (SAML Token Profile 1.1, section 3.4)
  Other,          ///< nothing that the service knows
};

/// A leg of a negotiation as it was received.
struct ReceivedLeg {
  std::string context;
  /// Counts the legs of the negotiation from 1. 0: no negotiation took it.
  unsigned ordinal = 0;
  std::string octets;
};

/// A request as it was received. Bodies hold passwords: they are for tests to look at, not for
/// logs.
struct ReceivedRequest {
  std::uint64_t connectionId = 0;       ///< counts accepted connections from 1
  std::size_t ordinalOnConnection = 0;  ///< counts the connection's requests from 1
  bool overTls = false;
  bool tlsSessionReused = false;
  std::string tlsVersion;          ///< "TLSv1.3", empty without TLS
  std::string serverName;          ///< the peer's server_name extension, empty if none
  std::string peerCertificatePem;  ///< the client certificate, empty if none
  std::string head;                ///< request line and header fields, octet for octet
  std::string method;
  std::string target;
  std::vector<std::pair<std::string, std::string>> headers;  ///< in order, names as sent
  std::string body;
  /// As far as the request was read: None, too, if its envelope or Security header is broken, or
  /// if a misbehaviour answered it. Whether the signature is right shows in the answer.
  RequestSignature signature = RequestSignature::None;
  /// Of a leg of a negotiation, as far as the request was read.
  std::optional<ReceivedLeg> leg;
  int answeredStatus = 0;     ///< 0 when raw octets were sent
  std::string answeredFault;  ///< faultstring of the fault that was answered, else empty

  /// The first field of this name, letter case ignored, else empty.
  std::string Header(const std::string& name) const;
  std::size_t HeaderCount(const std::string& name) const;
};

struct Counters {
  std::uint64_t connectionsAccepted = 0;
  std::uint64_t connectionsOpen = 0;
  std::uint64_t handshakesDone = 0;
  std::uint64_t handshakesFailed = 0;
  std::uint64_t handshakesResumed = 0;
  std::uint64_t requests = 0;
  std::uint64_t malformedRequests =
      0;  ///< what was not an HTTP request; such a connection is closed
  std::uint64_t tokensIssued = 0;
  std::uint64_t faults = 0;
  std::uint64_t negotiations = 0;      ///< first legs that a negotiation took
  std::uint64_t negotiationLegs = 0;   ///< all legs that one took
  std::uint64_t negotiatedTokens = 0;  ///< negotiations that ended in a token
  std::uint64_t stalls = 0;            ///< stalls that were reached
  std::uint64_t stalled = 0;           ///< connections that are stalled now
  std::uint64_t delayed = 0;           ///< requests whose answer is being delayed now
};

/// The service. It listens from construction to destruction on one HTTP and one HTTPS port, one
/// thread a connection, up to about 2,000 connections at once. Every member is safe to call from
/// any thread.
class Server {
 public:
  /// Throws `std::runtime_error` if a port cannot be opened, a certificate cannot be made or the
  /// keytab holds no key.
  explicit Server(ServerOptions options = {});
  /// Stops accepting, ends every connection and waits for their threads.
  ~Server();
  Server(const Server&) = delete;
  Server& operator=(const Server&) = delete;

  std::uint16_t HttpPort() const;
  std::uint16_t HttpsPort() const;
  /// With the numeric address as host, brackets around ::1.
  std::string HttpUrl(const std::string& path = "/sts") const;
  std::string HttpsUrl(const std::string& path = "/sts") const;
  /// The same with another host, "localhost" for instance.
  std::string HttpsUrlFor(const std::string& host, const std::string& path = "/sts") const;

  /// The CA that issued the TLS certificates.
  std::string CaCertificatePem() const;
  std::string ServerCertificatePem() const;
  /// The certificate whose key signs assertions, and its key for tests that sign their own.
  std::string SigningCertificatePem() const;
  Credential SigningCredential() const;
  /// Another signing certificate with the same subject name that the service never uses.
  Credential StrangerCredential() const;
  /// A client certificate issued by the CA.
  Credential MakeClientCredential(const std::string& commonName) const;

  void SetUsers(Users users);
  /// Adds a certificate by which this user may ask for tokens. Throws `std::out_of_range` if there
  /// is no such user, `std::runtime_error` if the certificate does not load.
  void RegisterCertificate(const std::string& userName, const std::string& certificatePem);

  /// From now on the issued token of this ID is neither valid nor accepted. False: no such token is
  /// known.
  bool Revoke(const std::string& assertionId);

  void SetAssertionOptions(AssertionOptions options);

  void SetNegotiationScript(NegotiationScript script);
  /// Negotiations that are under way.
  std::size_t OpenNegotiations() const;

  /// Applies to every request (and, for the stalls before a request, every connection) from now on.
  void SetMisbehavior(Misbehavior misbehavior);
  /// Forgets what both of these calls asked for.
  void ClearMisbehavior();
  /// Applies once to each of the next `count` requests, before what `SetMisbehavior` set and in the
  /// order of the calls. One with a stall before the request is used up by a connection, not by a
  /// request.
  void MisbehaveNext(Misbehavior misbehavior, std::size_t count = 1);

  std::vector<ReceivedRequest> Requests() const;
  /// Throws `std::out_of_range` if there was none.
  ReceivedRequest LastRequest() const;
  void ClearRequests();
  Counters GetCounters() const;
  /// Waits until `condition` holds of the counters, which is looked at after each change. False: it
  /// never did in time.
  bool WaitUntil(const std::function<bool(const Counters&)>& condition,
                 std::chrono::milliseconds timeout = std::chrono::seconds(10)) const;

 private:
  class Impl;
  std::unique_ptr<Impl> impl_;
};

}  // namespace DevSts

#endif
