#ifndef SSOCLIENT_STS_PASS_BY_REF_HELPER_H
#define SSOCLIENT_STS_PASS_BY_REF_HELPER_H

namespace SsoClient {

/// Binds an object of the caller's to an asynchronous call by reference, where other arguments are
/// copied: the caller keeps it alive until the callback has run.
template <class T>
class PassByRefHelper {
 public:
  explicit PassByRefHelper(T& object) noexcept : object_(&object) {}
  T& Get() const noexcept { return *object_; }

 private:
  T* object_;
};

}  // namespace SsoClient

#endif
