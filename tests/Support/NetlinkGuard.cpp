// SPDX-License-Identifier: Apache-2.0
#include "Support/NetlinkGuard.h"

#include <linux/audit.h>
#include <linux/filter.h>
#include <linux/netlink.h>
#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <array>
#include <cstddef>
#include <cstdint>

namespace test {

namespace {

#ifdef __i386__
constexpr unsigned int kArchitecture = AUDIT_ARCH_I386;
#elif defined(__aarch64__)
constexpr unsigned int kArchitecture = AUDIT_ARCH_AARCH64;
#else
constexpr unsigned int kArchitecture = AUDIT_ARCH_X86_64;
#endif
constexpr unsigned int kSocketCall = __NR_socket;

/// The lower half of an argument, on a little-endian machine.
constexpr unsigned int argument(std::size_t number) {
    return static_cast<unsigned int>(offsetof(seccomp_data, args) + number * sizeof(std::uint64_t));
}

constexpr sock_filter load(unsigned int offset) {
    return BPF_STMT(BPF_LD | BPF_W | BPF_ABS, offset);
}

/// Goes on with the next instruction if it is so, and otherwise leaves out as many as are told.
constexpr sock_filter unless(unsigned int value, unsigned char skipped) {
    return BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, value, 0, skipped);
}

}  // namespace

bool forbidGenericNetlink() {
    std::array filter{load(offsetof(seccomp_data, arch)),
                      unless(kArchitecture, 7),
                      load(offsetof(seccomp_data, nr)),
                      unless(kSocketCall, 5),
                      load(argument(0)),
                      unless(AF_NETLINK, 3),
                      load(argument(2)),
                      unless(NETLINK_GENERIC, 1),
                      sock_filter(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_KILL_PROCESS)),
                      sock_filter(BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW))};
    const sock_fprog program{filter.size(), filter.data()};
    return ::prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) == 0;
}

}  // namespace test
