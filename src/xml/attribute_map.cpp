#include "xml/attribute_map.h"

namespace SsoClient {

AttributeMap ToAttributeMap(const AttributeList& attributes) {
  return {attributes.begin(), attributes.end()};
}

}  // namespace SsoClient
