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

}  // namespace

bool forbidGenericNetlink() {
    constexpr std::uint16_t load = BPF_LD | BPF_W | BPF_ABS;
    constexpr std::uint16_t isEqual = BPF_JMP | BPF_JEQ | BPF_K;
    // A comparison that fails leaves out so many instructions. Arguments are looked at by their lower halves.
    std::array<sock_filter, 10> filter{
        {BPF_STMT(load, offsetof(seccomp_data, arch)), BPF_JUMP(isEqual, kArchitecture, 0, 7),
         BPF_STMT(load, offsetof(seccomp_data, nr)), BPF_JUMP(isEqual, __NR_socket, 0, 5),
         BPF_STMT(load, offsetof(seccomp_data, args[0])), BPF_JUMP(isEqual, AF_NETLINK, 0, 3),
         BPF_STMT(load, offsetof(seccomp_data, args[2])), BPF_JUMP(isEqual, NETLINK_GENERIC, 0, 1),
         BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_KILL_PROCESS), BPF_STMT(BPF_RET | BPF_K, SECCOMP_RET_ALLOW)}};
    const sock_fprog program{filter.size(), filter.data()};
    return ::prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &program) == 0;
}

}  // namespace test
