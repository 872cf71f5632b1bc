#ifndef TARNIK_HTTP_HTTP_RESPONSE_IMPL_H
#define TARNIK_HTTP_HTTP_RESPONSE_IMPL_H

#include <string>
#include <utility>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/http/http_response.h>

namespace Tarnik::Http {

/// Header fields in their order, names as written.
using HeaderFields = std::vector<std::pair<std::string, std::string>>;

/// The only implementation of `ClientResponse`.
class ClientResponseImpl final : public ClientResponse, public ObjectImpl {
 public:
  ClientResponseImpl(StatusLine status, HeaderFields headers, std::string body);

  const StatusLine& Status() const override;
  std::optional<std::string> Header(const std::string& name) const override;
  Ref<Reader> Body() const override;

  const HeaderFields& Headers() const noexcept { return headers_; }

 private:
  ~ClientResponseImpl() override;

  const StatusLine status_;
  const HeaderFields headers_;
  const Ref<Reader> body_;
};

}  // namespace Tarnik::Http

#endif
