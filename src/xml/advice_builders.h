#ifndef SSOCLIENT_XML_ADVICE_BUILDERS_H
#define SSOCLIENT_XML_ADVICE_BUILDERS_H

#include <memory>

#include <ssoclient/advice.h>

#include "xml/xml_composite_builder.h"

namespace SsoClient {

/// One rsa-advice:Advice with its attributes, in order. The prefix is declared by the AdviceSet
/// around it.
std::shared_ptr<XMLCompositeBuilder> BuildAdvice(const Advice& advice);

/// One rsa-advice:Attribute with its values, in order.
std::shared_ptr<XMLCompositeBuilder> BuildAdviceAttribute(const AdviceAttribute& attribute);

}  // namespace SsoClient

#endif
