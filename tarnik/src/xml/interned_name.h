#ifndef TARNIK_XML_INTERNED_NAME_H
#define TARNIK_XML_INTERNED_NAME_H

#include <string_view>

namespace Tarnik::Xml {

/// A qualified name stored in a tree; its characters follow it in memory. Shared by nodes and
/// attributes, since most names of a document occur many times.
struct InternedName {
  unsigned length;
  unsigned prefixLength : 31;
  /// True for "xmlns" and "xmlns:p", as attribute names.
  bool isDeclaration : 1;

  std::string_view Full() const noexcept {
    return {reinterpret_cast<const char*>(this + 1), length};
  }
  std::string_view Prefix() const noexcept { return Full().substr(0, prefixLength); }
  std::string_view Local() const noexcept {
    return prefixLength == 0 ? Full() : Full().substr(prefixLength + 1);
  }
  /// The prefix that a declaration binds: empty for "xmlns".
  std::string_view DeclaredPrefix() const noexcept {
    return prefixLength == 0 ? std::string_view() : Local();
  }
};

}  // namespace Tarnik::Xml

#endif
