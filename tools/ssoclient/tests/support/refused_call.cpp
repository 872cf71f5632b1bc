#include "support/refused_call.h"

#include <cerrno>
#include <cstddef>
#include <iterator>

#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <unistd.h>

namespace SsoClient::Tool::Testing {

void RefuseSystemCall(std::uint32_t number) {
  constexpr auto kNumber = static_cast<std::uint32_t>(offsetof(seccomp_data, nr));
  sock_filter instructions[] = {{BPF_LD | BPF_W | BPF_ABS, 0, 0, kNumber},
                                {BPF_JMP | BPF_JEQ | BPF_K, 0, 1, number},
                                {BPF_RET | BPF_K, 0, 0, SECCOMP_RET_ERRNO | EMFILE},
                                {BPF_RET | BPF_K, 0, 0, SECCOMP_RET_ALLOW}};
  const sock_fprog program{static_cast<unsigned short>(std::size(instructions)), instructions};
  if (prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) != 0 ||
      prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) != 0) {
    _exit(1);
  }
}

}  // namespace SsoClient::Tool::Testing
