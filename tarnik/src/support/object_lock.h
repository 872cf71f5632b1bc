#ifndef TARNIK_SUPPORT_OBJECT_LOCK_H
#define TARNIK_SUPPORT_OBJECT_LOCK_H

#include <mutex>

namespace Tarnik {

/// The lock of an object that a forked child continues to use, such as a cache. It is one of a few
/// mutexes of the process, chosen by the address of the object. All of them are held during a
/// `fork`, so that the child finds the objects consistent and unlocked.
///
/// Other objects may have the same lock: while one is held, no other is acquired, and no code of a
/// caller runs.
std::mutex& ObjectLock(const void* object) noexcept;

}  // namespace Tarnik

#endif
