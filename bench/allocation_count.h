#ifndef BENCH_ALLOCATION_COUNT_H
#define BENCH_ALLOCATION_COUNT_H

#include <cstddef>

namespace Bench {

/// The allocations of the calling thread so far by `operator new`, those in the libraries included.
std::size_t CountAllocations() noexcept;

}  // namespace Bench

#endif
