#include "xml/envelope.h"

#include "xml/builder_factories.h"
#include "xml/namespaces.h"

namespace SsoClient {

std::shared_ptr<XMLCompositeBuilder> BuildEnvelope(const std::shared_ptr<XMLBaseBuilder>& header,
                                                   const std::shared_ptr<XMLBaseBuilder>& body) {
  auto headerElement = MakeCompositeBuilder("soapenv", "Header");
  headerElement->Add(header);
  auto bodyElement = MakeCompositeBuilder("soapenv", "Body", {{"xmlns:wst", kWstNamespace}});
  bodyElement->Add(body);
  auto envelope = MakeCompositeBuilder("soapenv", "Envelope", {{"xmlns:soapenv", kSoapNamespace}});
  envelope->Add(headerElement).Add(bodyElement);
  return envelope;
}

}  // namespace SsoClient
