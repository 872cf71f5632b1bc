#ifndef BENCH_TOKEN_MEMORY_H
#define BENCH_TOKEN_MEMORY_H

#include <cstddef>

namespace Bench {

/// Bytes of heap that one living token of about `size` bytes of text holds, the allocator's own
/// overhead included, measured over many tokens.
double TokenMemory(std::size_t size);

}  // namespace Bench

#endif
