#ifndef FUZZ_TOKEN_LAYOUT_H
#define FUZZ_TOKEN_LAYOUT_H

#include <string>
#include <vector>

#include "token_model.h"
#include "xml_tree.h"

namespace Fuzz {

/// Thrown where a token is not as it has to be.
struct NotAToken {};

inline void Demand(bool holds) {
  if (!holds) {
    throw NotAToken();
  }
}

/// The value of an optional.
template <class Value>
Value Demanded(const std::optional<Value>& value) {
  Demand(value.has_value());
  return *value;
}

inline const std::string kSaml = "urn:oasis:names:tc:SAML:2.0:assertion";
inline const std::string kDelegation = "urn:oasis:names:tc:SAML:2.0:conditions:delegation";
inline const std::string kSignatures = "http://www.w3.org/2000/09/xmldsig#";
/// The vendor's host is part of the configuration of a build.
inline const std::string kVendorTypes = "http://sts-vendor.example/names/2009/12/std-ext/SAML2.0";

/// The content of an element, in order.
class Contents {
 public:
  explicit Contents(const xmlNode* element) : items_(ContentOf(element)) {}

  /// True if the next item is an element of this name and namespace.
  bool IsAt(const std::string& name, const std::string& space = kSaml) const {
    return IsAtElement() && LocalNameOf(items_[next_].node) == name &&
           NamespaceOf(items_[next_].node) == space;
  }
  bool IsAtElement() const { return next_ < items_.size() && items_[next_].isElement; }
  bool IsAtEnd() const { return next_ == items_.size(); }
  /// The next item, which has to be an element of this name and namespace.
  const xmlNode* Take(const std::string& name, const std::string& space = kSaml) {
    Demand(IsAt(name, space));
    return TakeAny();
  }
  const xmlNode* TakeAny() {
    Demand(IsAtElement());
    return items_[next_++].node;
  }
  void DemandEnd() const { Demand(IsAtEnd()); }

 private:
  std::vector<Item> items_;
  std::size_t next_ = 0;
};

/// What the lists below call the attribute xsi:type, which may have any prefix.
inline const std::string kTypeAttribute = "{xsi}type";

/// Every one of `required` is there, and nothing but these and `optional`.
void DemandAttributes(const xmlNode* element, const std::vector<std::string>& required,
                      const std::vector<std::string>& optional = {});
void DemandNoContent(const xmlNode* element);
/// The text of an element that has a text and nothing else.
std::string OnlyTextOf(const xmlNode* element);
/// The date in an attribute that is there.
long DateAttributeOf(const xmlNode* element, const std::string& name);
/// The value of xsi:type, if the element has it.
std::optional<std::string> TypeOf(const xmlNode* element);
/// True if the name in an xsi:type is that of the type of this namespace; its prefix has to be
/// declared.
bool IsNameOfType(const xmlNode* element, const std::string& written, const std::string& space,
                  const std::string& name);

/// The parts of an assertion. Each element has the expected name already.
ModelPrincipal PrincipalOf(const xmlNode* nameId);
void ReadSubject(const xmlNode* subject, ModelToken& token);
void ReadConditions(const xmlNode* conditions, ModelToken& token);
void ReadAdvice(const xmlNode* advice, ModelToken& token);
void ReadAuthnStatement(const xmlNode* statement);
void ReadAttributeStatement(const xmlNode* statement, ModelToken& token);

}  // namespace Fuzz

#endif
