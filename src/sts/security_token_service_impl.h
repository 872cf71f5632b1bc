#ifndef SSOCLIENT_STS_SECURITY_TOKEN_SERVICE_IMPL_H
#define SSOCLIENT_STS_SECURITY_TOKEN_SERVICE_IMPL_H

#include <memory>
#include <string>

#include <ssoclient/security_token_service.h>

#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "transport/transport.h"

namespace SsoClient {

/// Uses four parts, none of which may be null. Copies share the parts.
class SecurityTokenServiceImpl final : public SecurityTokenService {
 public:
  SecurityTokenServiceImpl(std::shared_ptr<const RequestBuilder> requestBuilder,
                           std::shared_ptr<const Transport> transport,
                           std::shared_ptr<const ResponseHandler> responseHandler,
                           std::shared_ptr<SamlTokenFactory> tokenFactory);

  std::shared_ptr<const SamlToken> AcquireToken(const std::string& userName,
                                                const std::string& password,
                                                const TokenSpec& spec) const override;
  std::shared_ptr<const SamlToken> AcquireTokenByGSS(const TokenSpec& spec,
                                                     NegotiationHandler& handler) const override;
  std::shared_ptr<const SamlToken> AcquireTokenByCertificate(const TokenSpec& spec) const override;
  std::shared_ptr<const SamlToken> AcquireTokenByToken(const SamlToken& token,
                                                       const TokenSpec& spec) const override;
  bool ValidateSubject(const SamlToken& token) const override;
  std::shared_ptr<const SamlToken> RenewToken(const SamlToken& token,
                                              std::int64_t lifetimeSec) const override;

  void AcquireTokenAsync(const std::string& userName, const std::string& password,
                         const TokenSpec& spec, TokenCallback callback) const override;
  void AcquireTokenByGSSAsync(const TokenSpec& spec, NegotiationHandler& handler,
                              TokenCallback callback) const override;
  void AcquireTokenByCertificateAsync(const TokenSpec& spec, TokenCallback callback) const override;
  void AcquireTokenByTokenAsync(const SamlToken& token, const TokenSpec& spec,
                                TokenCallback callback) const override;
  void ValidateSubjectAsync(const SamlToken& token, ValidateCallback callback) const override;
  void RenewTokenAsync(const SamlToken& token, std::int64_t lifetimeSec,
                       TokenCallback callback) const override;

 private:
  /// What an asynchronous call uses, since it may outlive this object.
  std::shared_ptr<const SecurityTokenServiceImpl> Copy() const;
  Tarnik::Ref<Tarnik::Reader> Send(const SoapRequest& request) const;
  std::shared_ptr<const SamlToken> MakeIssuedToken(Tarnik::Reader* response) const;
  std::shared_ptr<const SamlToken> MakeToken(const std::string& assertion) const;

  std::shared_ptr<const RequestBuilder> requestBuilder_;
  std::shared_ptr<const Transport> transport_;
  std::shared_ptr<const ResponseHandler> responseHandler_;
  std::shared_ptr<SamlTokenFactory> tokenFactory_;
};

}  // namespace SsoClient

#endif
