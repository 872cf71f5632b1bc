#ifndef SSOCLIENT_TESTS_SUPPORT_VTABLE_SLOT_H
#define SSOCLIENT_TESTS_SUPPORT_VTABLE_SLOT_H

#include <cstddef>

namespace SsoClient::Testing {

/// The function in slot `index` of the object's primary virtual table (Itanium C++ ABI, section
/// 2.5), as a free function whose first parameter is the object.
template <class Function>
Function* VtableSlot(const void* object, std::size_t index) {
  void* const* const table = *static_cast<void* const* const*>(object);
  return reinterpret_cast<Function*>(table[index]);
}

}  // namespace SsoClient::Testing

#endif
