#ifndef TARNIK_SUPPORT_OPENSSL_SECTION_H
#define TARNIK_SUPPORT_OPENSSL_SECTION_H

namespace Tarnik::OpenSsl {

/// Calls of OpenSSL are in a section, which may contain others. OpenSSL's own locks are not held
/// during a `fork`: one that another thread holds at that moment would remain locked in the child.
/// A `fork` therefore waits, for at most a second, until no other thread is in a section.
class Section {
 public:
  Section() noexcept;
  ~Section();
  Section(const Section&) = delete;
  Section& operator=(const Section&) = delete;
};

}  // namespace Tarnik::OpenSsl

#endif
