#ifndef TARNIK_SYSTEM_POST_WITH_H
#define TARNIK_SYSTEM_POST_WITH_H

#include <utility>

#include <boost/asio/io_context.hpp>
#include <boost/asio/post.hpp>

#include "system/handler_memory.h"
#include "system/thread_pool_impl.h"

namespace Tarnik::System {

/// As `ThreadPool::Post`, but the completion is stored in `memory`: once the pool has been started
/// in this process, this cannot fail unless the memory is in use.
template <class Completion>
void PostWith(HandlerMemory& memory, Completion completion) {
  boost::asio::post(ProcessThreadPool().IoContext(), WithMemory(memory, std::move(completion)));
}

}  // namespace Tarnik::System

#endif
