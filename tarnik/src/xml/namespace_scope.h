#ifndef TARNIK_XML_NAMESPACE_SCOPE_H
#define TARNIK_XML_NAMESPACE_SCOPE_H

#include <cstddef>
#include <map>
#include <string_view>
#include <vector>

namespace Tarnik::Xml {

/// The namespace declarations in scope while a tree is walked, innermost last.
///
/// A few declarations are searched linearly, which is fastest; when a document declares many, they
/// are indexed. Views must outlive the scope.
class NamespaceScope {
 public:
  struct Binding {
    std::string_view prefix;
    std::string_view uri;
    /// The URI that the canonical output has bound to the prefix so far; empty for none.
    std::string_view rendered;
    unsigned depth;
  };

  NamespaceScope() { bindings_.reserve(kLinearLimit); }

  /// The innermost binding of `prefix`, or null. Valid until the next change.
  Binding* Find(std::string_view prefix) noexcept;

  void Push(const Binding& binding);

  /// Removes the bindings of elements at `depth` and deeper.
  void PopTo(unsigned depth) noexcept {
    while (!bindings_.empty() && bindings_.back().depth >= depth) {
      Pop();
    }
  }

  std::size_t Size() const noexcept { return bindings_.size(); }
  const Binding& At(std::size_t index) const noexcept { return bindings_[index]; }

 private:
  static constexpr std::size_t kLinearLimit = 32;

  void Pop() noexcept;
  void BuildIndex();

  std::vector<Binding> bindings_;
  bool indexed_ = false;
  std::map<std::string_view, std::vector<std::size_t>> index_;
};

}  // namespace Tarnik::Xml

#endif
