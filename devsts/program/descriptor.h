#ifndef DEVSTS_PROGRAM_DESCRIPTOR_H
#define DEVSTS_PROGRAM_DESCRIPTOR_H

#include <string>

namespace DevSts::Program {

// A file descriptor that the destructor closes.
class Descriptor {
 public:
  Descriptor() = default;
  explicit Descriptor(int number) : number_(number) {}
  ~Descriptor();
  Descriptor(Descriptor&& other) noexcept;
  Descriptor& operator=(Descriptor&& other) noexcept;

  int Get() const { return number_; }

 private:
  int number_ = -1;
};

// Opens /dev/null in place of each standard stream that is closed, whose number another file would
// otherwise take.
void OpenStandardStreams();

// Writes everything, and ignores errors of a reader that has gone.
void WriteToDescriptor(int descriptor, const std::string& text);

}  // namespace DevSts::Program

#endif
