#ifndef TARNIK_CORE_THROWABLE_H
#define TARNIK_CORE_THROWABLE_H

#include <exception>
#include <memory>
#include <string>

#include <boost/assert/source_location.hpp>

#include <tarnik/export.h>

namespace Tarnik {

/// The source location of the call in which this function is a default argument.
constexpr boost::source_location CurrentLocation(const char* file = __builtin_FILE(),
                                                 boost::uint_least32_t line = __builtin_LINE(),
                                                 const char* function = __builtin_FUNCTION()) {
  return boost::source_location(file, line, function);
}

/// Base class of everything that the platform throws. The order of the virtual functions is part of
/// the binary interface: destructors, `what`, `Message`, `Dump`, `Where`, `Clone`, `Throw`.
class TARNIK_EXPORT Throwable : public std::exception {
 public:
  /// Copies share the message: copying does not allocate and cannot fail.
  Throwable(const Throwable&) = default;
  /// As the copy constructor.
  Throwable& operator=(const Throwable&) = default;
  ~Throwable() override;

  /// The message as a C string; valid as long as this object.
  const char* what() const noexcept override;
  /// The message.
  virtual const std::string& Message() const noexcept;
  /// Class, message and source location in one line, for logs: "Class: message (file:line,
  /// function)".
  virtual std::string Dump() const;
  /// The source location where the exception was created.
  virtual boost::source_location Where() const noexcept;
  /// A copy on the heap with this object's exact class.
  virtual std::unique_ptr<Throwable> Clone() const = 0;
  /// Throws a copy of this object as its exact class.
  [[noreturn]] virtual void Throw() const = 0;

 protected:
  /// For derived classes: an exception with this message, which was created at `where`.
  Throwable(std::string message, const boost::source_location& where);

 private:
  // Shared, so that copying an exception does not allocate and cannot fail.
  std::shared_ptr<const std::string> message_;
  boost::source_location where_;
};

}  // namespace Tarnik

#endif
