#include "xml/advice_builders.h"

#include "xml/builder_factories.h"

namespace SsoClient {

std::shared_ptr<XMLCompositeBuilder> BuildAdvice(const Advice& advice) {
  auto builder = MakeCompositeBuilder("rsa-advice", "Advice", {{"AdviceSource", advice.source}});
  for (const auto& attribute : advice.attributes) {
    builder->Add(BuildAdviceAttribute(attribute));
  }
  return builder;
}

std::shared_ptr<XMLCompositeBuilder> BuildAdviceAttribute(const AdviceAttribute& attribute) {
  auto builder = MakeCompositeBuilder("rsa-advice", "Attribute", {{"Name", attribute.name}});
  for (const auto& value : attribute.values) {
    builder->Add(
        MakeTextElementBuilder("rsa-advice", "AttributeValue", value, {{"xsi:type", "xs:string"}}));
  }
  return builder;
}

}  // namespace SsoClient
