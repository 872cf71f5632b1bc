#ifndef TARNIK_XML_EXPAT_MEMORY_H
#define TARNIK_XML_EXPAT_MEMORY_H

#include <cstddef>

#include <expat.h>

namespace Tarnik::Xml {

/// The memory of one Expat parser. It is cleansed before it is freed, since documents contain
/// passwords and tokens. The many small pieces that a parser allocates are taken from a few blocks,
/// which live as long as this object.
///
/// Expat does not pass the parser to its memory functions, so a parser may be created and used only
/// while a `Scope` of its memory is open on the thread.
class ExpatMemory {
 public:
  class Scope {
   public:
    explicit Scope(ExpatMemory& memory) noexcept;
    ~Scope();
    Scope(const Scope&) = delete;
    Scope& operator=(const Scope&) = delete;

   private:
    ExpatMemory* outer_;
  };

  ExpatMemory() = default;
  ExpatMemory(const ExpatMemory&) = delete;
  ExpatMemory& operator=(const ExpatMemory&) = delete;
  /// Must be destroyed after the parser.
  ~ExpatMemory();

  static const XML_Memory_Handling_Suite& Suite() noexcept;

 private:
  struct alignas(std::max_align_t) Block {
    Block* next;
  };

  static void* Allocate(std::size_t size) noexcept;
  static void* Reallocate(void* memory, std::size_t size) noexcept;
  static void Free(void* memory) noexcept;

  void* AllocateSmall(std::size_t size) noexcept;

  Block* blocks_ = nullptr;
  char* free_ = nullptr;
  char* freeEnd_ = nullptr;
};

}  // namespace Tarnik::Xml

#endif
