#ifndef SSOCLIENT_XML_WS_TRUST_NAMES_H
#define SSOCLIENT_XML_WS_TRUST_NAMES_H

namespace SsoClient {

/// The URIs that one version of WS-Trust fixes.
struct WsTrustNames {
  const char* namespaceUri;

  /// wst:RequestType of each operation.
  const char* issueRequestType;
  const char* renewRequestType;
  const char* validateRequestType;

  /// SOAPAction of each request. The later legs of a negotiation are responses of the requestor.
  const char* issueAction;
  const char* renewAction;
  const char* validateAction;
  const char* continuedIssueAction;

  /// wst:KeyType of holder-of-key and of bearer tokens.
  const char* publicKeyType;
  const char* bearerKeyType;

  /// wst:TokenType of a Validate request, and the two values of wst:Code in its answer.
  const char* statusTokenType;
  const char* validStatus;
  const char* invalidStatus;
};

/// WS-Trust 1.3: sections 4 (issuance), 5 (renewal), 7 (validation) and 9.2 (key types).
inline constexpr WsTrustNames kWsTrust13 = {
    .namespaceUri = "http://docs.oasis-open.org/ws-sx/ws-trust/200512",
    .issueRequestType = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/Issue",
    .renewRequestType = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/Renew",
    .validateRequestType = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/Validate",
    .issueAction = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue",
    .renewAction = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Renew",
    .validateAction = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Validate",
    .continuedIssueAction = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/Issue",
    .publicKeyType = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/PublicKey",
    .bearerKeyType = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/Bearer",
    .statusTokenType = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/Status",
    .validStatus = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/valid",
    .invalidStatus = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/status/invalid",
};

/// The namespace of wst14:ActAs (WS-Trust 1.4, section 9.3), which requests use in addition to
/// WS-Trust 1.3.
inline constexpr char kWst14Namespace[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200802";

}  // namespace SsoClient

#endif
