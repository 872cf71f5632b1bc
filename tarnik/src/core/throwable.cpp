#include <typeinfo>
#include <utility>

#include <boost/core/demangle.hpp>

#include <tarnik/core/throwable.h>

namespace Tarnik {

Throwable::Throwable(std::string message, const boost::source_location& where)
    : message_(std::make_shared<const std::string>(std::move(message))), where_(where) {}

Throwable::~Throwable() = default;

const char* Throwable::what() const noexcept {
  return message_->c_str();
}

const std::string& Throwable::Message() const noexcept {
  return *message_;
}

std::string Throwable::Dump() const {
  return boost::core::demangle(typeid(*this).name()) + ": " + *message_ + " (" +
         where_.file_name() + ":" + std::to_string(where_.line()) + ", " + where_.function_name() +
         ")";
}

boost::source_location Throwable::Where() const noexcept {
  return where_;
}

}  // namespace Tarnik
