#include "xml/namespace_scope.h"

#include "xml/equal_prefixes.h"

namespace Tarnik::Xml {

NamespaceScope::Binding* NamespaceScope::Find(std::string_view prefix) noexcept {
  if (!indexed_) {
    for (std::size_t index = bindings_.size(); index > 0; --index) {
      if (EqualPrefixes(bindings_[index - 1].prefix, prefix)) {
        return &bindings_[index - 1];
      }
    }
    return nullptr;
  }
  const auto found = index_.find(prefix);
  return found == index_.end() || found->second.empty() ? nullptr
                                                        : &bindings_[found->second.back()];
}

void NamespaceScope::Push(const Binding& binding) {
  bindings_.push_back(binding);
  if (indexed_) {
    index_[binding.prefix].push_back(bindings_.size() - 1);
    return;
  }
  if (bindings_.size() > kLinearLimit) {
    BuildIndex();
  }
}

void NamespaceScope::Pop() noexcept {
  if (indexed_) {
    index_.find(bindings_.back().prefix)->second.pop_back();
  }
  bindings_.pop_back();
}

void NamespaceScope::BuildIndex() {
  for (std::size_t index = 0; index < bindings_.size(); ++index) {
    index_[bindings_[index].prefix].push_back(index);
  }
  indexed_ = true;
}

}  // namespace Tarnik::Xml
