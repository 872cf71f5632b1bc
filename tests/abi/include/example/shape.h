// The interface of a small library. Each macro changes it as its name says.
#ifndef EXAMPLE_SHAPE_H
#define EXAMPLE_SHAPE_H

#include <memory>

#define EXAMPLE_EXPORT __attribute__((visibility("default")))

namespace Example {

struct Size {
#ifdef EXAMPLE_MEMBER_REPLACED
  float width = 0;
#else
  int width = 0;
#endif
  int height = 0;
#ifdef EXAMPLE_MEMBER_ADDED
  int depth = 0;
#endif
};

class EXAMPLE_EXPORT Shape {
 public:
  virtual ~Shape();
#ifdef EXAMPLE_VIRTUALS_SWAPPED
  virtual int Area() const;
  virtual Size Extent() const;
#else
  virtual Size Extent() const;
#ifndef EXAMPLE_VIRTUAL_REMOVED
  virtual int Area() const;
#endif
#endif
  virtual int Colour() const;
};

/// Implemented in the sources only.
class Painter {
 public:
  virtual ~Painter() = default;
#ifndef EXAMPLE_INTERFACE_FUNCTION_REMOVED
  virtual void Clear() = 0;
#endif
  virtual void Paint(const Shape& shape) = 0;
};

EXAMPLE_EXPORT Shape* MakeShape(const Size& size);
EXAMPLE_EXPORT std::unique_ptr<Painter> MakePainter();
#ifndef EXAMPLE_FUNCTION_REMOVED
EXAMPLE_EXPORT int CountShapes();
#endif
#ifdef EXAMPLE_FUNCTION_ADDED
EXAMPLE_EXPORT int CountColours();
#endif

}  // namespace Example

#endif
