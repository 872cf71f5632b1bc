#include "sts/negotiation_leg.h"

namespace SsoClient {

namespace {

void BuildRequest(const RequestBuilder& builder, const TokenSpec& spec,
                  const std::string& contextId, const std::vector<unsigned char>& leg,
                  SoapRequest& request) {
  if (contextId.empty()) {
    builder.BuildInitialNegotiationRequest(spec, leg, request);
    return;
  }
  builder.BuildContinuedNegotiationRequest(contextId, leg, request);
}

}  // namespace

NegotiationResponse SendNegotiationLeg(const NegotiationParts& parts, const TokenSpec& spec,
                                       const std::string& contextId,
                                       const std::vector<unsigned char>& leg) {
  SoapRequest request;
  BuildRequest(parts.requestBuilder, spec, contextId, leg, request);
  Tarnik::Ref<Tarnik::Reader> reader;
  parts.session.SendRequest(request, reader);
  NegotiationResponse answer;
  parts.responseHandler.ParseNegotiationResponse(reader.get(), answer);
  return answer;
}

}  // namespace SsoClient
