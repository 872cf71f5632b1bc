#include "sts/logger.h"

namespace SsoClient {

const Tarnik::Service::StaticLogger kLogger("SsoClient");

OperationLog::OperationLog(std::string_view operation) : operation_(operation) {
  Tarnik::Service::LogInternal(kLogger, kTraceLevel, "START operation SecurityTokenServiceImpl::%1",
                               {operation_});
}

OperationLog::~OperationLog() {
  try {
    Tarnik::Service::LogInternal(kLogger, kTraceLevel, "END operation SecurityTokenServiceImpl::%1",
                                 {operation_});
  } catch (...) {
    // Without memory the line is lost; the outcome of the operation is not.
  }
}

}  // namespace SsoClient
