#ifndef SSOCLIENT_STS_REQUEST_BUILDER_IMPL_H
#define SSOCLIENT_STS_REQUEST_BUILDER_IMPL_H

#include <memory>
#include <string>
#include <vector>

#include <boost/optional.hpp>

#include <ssoclient/holder_of_key_config.h>

#include "sts/request_builder.h"
#include "xml/xml_base_builder.h"

namespace SsoClient {

/// Builds requests, and signs with a key those that prove its possession.
class RequestBuilderImpl final : public RequestBuilder {
 public:
  explicit RequestBuilderImpl(boost::optional<HolderOfKeyConfig> holderOfKeyConfig);

  void BuildAcquireTokenRequest(const std::string& userName, const std::string& password,
                                const TokenSpec& spec, SoapRequest& request) const override;
  void BuildInitialNegotiationRequest(const TokenSpec& spec, const std::vector<unsigned char>& leg,
                                      SoapRequest& request) const override;
  void BuildContinuedNegotiationRequest(const std::string& contextId,
                                        const std::vector<unsigned char>& leg,
                                        SoapRequest& request) const override;
  void BuildAcquireTokenByCertificateRequest(const TokenSpec& spec,
                                             SoapRequest& request) const override;
  void BuildAcquireTokenByTokenRequest(const SamlToken& token, const TokenSpec& spec,
                                       SoapRequest& request) const override;
  void BuildValidateRequest(const SamlToken& token, SoapRequest& request) const override;
  void BuildRenewRequest(const SamlToken& token, std::int64_t lifetimeSec,
                         SoapRequest& request) const override;

 private:
  const HolderOfKeyConfig& RequireHolderOfKey(const std::string& operation) const;
  bool AsksForHolderOfKey(const TokenSpec& spec) const;
  /// The key type that the body of a request asks for, as `BuildIssueBody` takes it.
  unsigned KeyTypeFor(const TokenSpec& spec) const;
  /// The envelope of a request that proves who asks by other means than the key: signed when the
  /// token is to be bound to the key.
  std::shared_ptr<XMLBaseBuilder> Enclose(const TokenSpec& spec,
                                          const std::shared_ptr<XMLBaseBuilder>& header,
                                          const std::shared_ptr<XMLBaseBuilder>& body) const;

  boost::optional<HolderOfKeyConfig> holderOfKeyConfig_;
};

}  // namespace SsoClient

#endif
