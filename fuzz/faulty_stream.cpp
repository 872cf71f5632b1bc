#include "faulty_stream.h"

#include <algorithm>
#include <map>
#include <new>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/system/thread_pool.h>

namespace Fuzz {
namespace {

constexpr const char* kPlanted = "a planted fault";

void Post(std::function<void()> completion) {
  Tarnik::System::GetThreadPool()->Post(std::move(completion));
}

}  // namespace

StreamFault StreamFaultOf(const Words& line) {
  using Kind = StreamFault::Kind;
  static const std::map<std::string, Kind> kinds = {{"throws", Kind::kThrows},
                                                    {"throws-state", Kind::kThrowsState},
                                                    {"throws-memory", Kind::kThrowsMemory},
                                                    {"fails", Kind::kFails},
                                                    {"cancelled", Kind::kIsCancelled},
                                                    {"ends", Kind::kEnds}};
  const auto kind = line.size() == 4 ? kinds.find(line[3]) : kinds.end();
  if (kind == kinds.end() || line[2].size() != 1 || (line[1] == "write" && line[3] == "ends")) {
    return {};
  }
  return {kind->second, line[1] == "write", line[2].front() - '0'};
}

void FaultyStream::ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) {
  if (Misbehaves(false, [=](Tarnik::Exception* error) { completion(0, error); })) {
    return;
  }
  if (greeting_.empty()) {
    below_->ReadAsync(buffer, size, std::move(completion));
    return;
  }
  const std::size_t count = std::min(size, greeting_.size());
  std::copy_n(greeting_.begin(), count, buffer);
  greeting_.erase(0, count);
  Post([completion = std::move(completion), count] { completion(count, nullptr); });
}

void FaultyStream::WriteAsync(const char* data, std::size_t size, WriteCompletion completion) {
  if (!Misbehaves(true, completion)) {
    below_->WriteAsync(data, size, std::move(completion));
  }
}

bool FaultyStream::Misbehaves(bool isWrite,
                              const std::function<void(Tarnik::Exception*)>& completion) {
  const int operation = isWrite ? ++writes_ : ++reads_;
  if (fault_.kind == StreamFault::Kind::kNone || fault_.isWrite != isWrite ||
      fault_.operation != operation) {
    return false;
  }
  hasFaulted_ = true;
  switch (fault_.kind) {
    case StreamFault::Kind::kThrows:
      throw Tarnik::IOException(kPlanted);
    case StreamFault::Kind::kThrowsState:
      throw Tarnik::InvalidStateException(kPlanted);
    case StreamFault::Kind::kThrowsMemory:
      throw std::bad_alloc();
    case StreamFault::Kind::kFails:
      Post([completion] {
        Tarnik::IOException error(kPlanted);
        completion(&error);
      });
      break;
    case StreamFault::Kind::kIsCancelled:
      Post([completion] {
        Tarnik::CancelledException error(kPlanted);
        completion(&error);
      });
      break;
    default:
      Post([completion] { completion(nullptr); });
      break;
  }
  return true;
}

std::string FaultyStream::FaultText() const {
  switch (fault_.kind) {
    case StreamFault::Kind::kNone:
      return "";
    case StreamFault::Kind::kThrowsMemory:
      return "memory";
    case StreamFault::Kind::kEnds:
      return "closed";
    default:
      return kPlanted;
  }
}

}  // namespace Fuzz
