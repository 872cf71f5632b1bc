#include "signature_model.h"

#include "token_layout.h"
#include "value_model.h"

namespace Fuzz {
namespace {

constexpr int kMaxReferences = 16;

// A value is one text without CDATA sections, comments and processing instructions, which other
// readers may treat as the end of the value.
void DemandBytes(const xmlNode* element) {
  std::string text;
  for (const xmlNode* node = element->children; node != nullptr; node = node->next) {
    Demand(node->type == XML_TEXT_NODE);
    text += reinterpret_cast<const char*>(node->content);
  }
  Demand(!Demanded(BytesOf(text)).empty());
}

void DemandAlgorithm(Contents& contents, const std::string& name) {
  DemandAttributes(contents.Take(name, kSignatures), {"Algorithm"});
}

void DemandTransforms(const xmlNode* element) {
  DemandAttributes(element, {});
  Contents contents(element);
  do {
    DemandAlgorithm(contents, "Transform");
  } while (!contents.IsAtEnd());
}

void DemandReference(const xmlNode* element) {
  DemandAttributes(element, {"URI"}, {"Id", "Type"});
  Contents contents(element);
  if (contents.IsAt("Transforms", kSignatures)) {
    DemandTransforms(contents.TakeAny());
  }
  DemandAlgorithm(contents, "DigestMethod");
  const xmlNode* value = contents.Take("DigestValue", kSignatures);
  DemandAttributes(value, {});
  DemandBytes(value);
  contents.DemandEnd();
}

void DemandSignedInfo(const xmlNode* element) {
  DemandAttributes(element, {}, {"Id"});
  Contents contents(element);
  DemandAlgorithm(contents, "CanonicalizationMethod");
  DemandAlgorithm(contents, "SignatureMethod");
  int references = 0;
  do {
    DemandReference(contents.Take("Reference", kSignatures));
    Demand(++references <= kMaxReferences);
  } while (!contents.IsAtEnd());
}

void DemandSignature(const xmlNode* element) {
  Demand(LocalNameOf(element) == "Signature" && NamespaceOf(element) == kSignatures);
  DemandAttributes(element, {}, {"Id"});
  Contents contents(element);
  DemandSignedInfo(contents.Take("SignedInfo", kSignatures));
  const xmlNode* value = contents.Take("SignatureValue", kSignatures);
  DemandAttributes(value, {}, {"Id"});
  DemandBytes(value);
  if (contents.IsAt("KeyInfo", kSignatures)) {
    DemandAttributes(contents.TakeAny(), {}, {"Id"});
  }
  contents.DemandEnd();
}

}  // namespace

bool IsSignatureShaped(const xmlNode* element) {
  try {
    DemandSignature(element);
    return true;
  } catch (const NotAToken&) {
    return false;
  }
}

}  // namespace Fuzz
