#ifndef DEVSTS_EXPECT_FAULT_H
#define DEVSTS_EXPECT_FAULT_H

#include <string>

#include <gmock/gmock.h>

#include "request_text.h"

namespace DevSts::Testing {

// Expects the answer to be a fault with this code and a text that starts with `reason`.
inline void ExpectFault(const std::string& answer, const std::string& code,
                        const std::string& reason) {
  EXPECT_THAT(answer, testing::StartsWith("HTTP/1.1 500 Internal Server Error\r\n"));
  EXPECT_EQ(ElementText(answer, "faultcode"), code);
  EXPECT_THAT(ElementText(answer, "faultstring"), testing::StartsWith(reason));
}

}  // namespace DevSts::Testing

#endif
