#include "example/shape.h"

namespace Example {

namespace {

class Box : public Shape {
 public:
  explicit Box(const Size& size) : size_(size) {}
  Size Extent() const override { return size_; }

 private:
  Size size_;
#ifdef EXAMPLE_HIDDEN_MEMBER_ADDED
  long hidden_ = 0;
#endif
};

class Pen : public Painter {
 public:
#ifndef EXAMPLE_INTERFACE_FUNCTION_REMOVED
  void Clear() override {}
#endif
  void Paint(const Shape&) override {}
};

}  // namespace

Shape::~Shape() = default;

Size Shape::Extent() const {
  return {};
}

#ifndef EXAMPLE_VIRTUAL_REMOVED
int Shape::Area() const {
  return 0;
}
#endif

int Shape::Colour() const {
  return 0;
}

Shape* MakeShape(const Size& size) {
  return new Box(size);
}

std::unique_ptr<Painter> MakePainter() {
  return std::make_unique<Pen>();
}

#ifndef EXAMPLE_FUNCTION_REMOVED
int CountShapes() {
  return 1;
}
#endif

#ifdef EXAMPLE_FUNCTION_ADDED
int CountColours() {
  return 1;
}
#endif

}  // namespace Example
