#ifndef TARNIK_SUPPORT_CLEANSE_H
#define TARNIK_SUPPORT_CLEANSE_H

#include <string>
#include <vector>

namespace Tarnik {

/// Overwrites the whole buffer of `text` in a way that is not optimised away, then empties it.
void CleanseBuffer(std::string& text) noexcept;
/// The same for bytes.
void CleanseBuffer(std::vector<unsigned char>& bytes) noexcept;

}  // namespace Tarnik

#endif
