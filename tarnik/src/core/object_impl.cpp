#include <typeinfo>

#include <boost/core/demangle.hpp>

#include <tarnik/core/object_impl.h>

namespace Tarnik {

ObjectImpl::~ObjectImpl() = default;

void ObjectImpl::IncRef() const noexcept {
  if (refCount_.fetch_add(1, std::memory_order_relaxed) == 0) {
    OnFirstRef();
  }
}

void ObjectImpl::DecRef() const noexcept {
  if (refCount_.fetch_sub(1, std::memory_order_acq_rel) == 1) {
    OnLastRef();
    delete this;
  }
}

std::string ObjectImpl::ToString() const {
  return "<" + boost::core::demangle(typeid(*this).name()) + ">";
}

long ObjectImpl::RefCount() const noexcept {
  return refCount_.load(std::memory_order_relaxed);
}

void ObjectImpl::OnFirstRef() const noexcept {}

void ObjectImpl::OnLastRef() const noexcept {}

bool ObjectImpl::IncRefIfAlive() const noexcept {
  long count = refCount_.load(std::memory_order_relaxed);
  while (count > 0) {
    if (refCount_.compare_exchange_weak(count, count + 1, std::memory_order_acq_rel)) {
      return true;
    }
  }
  return false;
}

}  // namespace Tarnik
