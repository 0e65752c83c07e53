// SPDX-License-Identifier: Apache-2.0
#include <sys/resource.h>

#include <algorithm>

#include "Host/Authentication/ClientAddress.h"
#include "Host/Daemon/Daemon.h"
#include "Host/Server/ConnectionWatch.h"

namespace host {

namespace {

/// A socket for each connection, an image and a pipe for each request, and what the process has open anyway.
std::uint64_t descriptorsFor(const ServerLimits& limits) {
    constexpr std::uint64_t kOthers = 64;
    return ConnectionWatch::mostOf(limits) + 2ULL * limits.workers + kOthers;
}

rlimit descriptorLimit() {
    rlimit limit{RLIM_INFINITY, RLIM_INFINITY};  // what is assumed if it cannot be known
    ::getrlimit(RLIMIT_NOFILE, &limit);
    return limit;
}

}  // namespace

std::uint64_t mostDescriptors() {
    return descriptorLimit().rlim_max;
}

std::uint64_t raiseDescriptors(const Settings& settings) {
    rlimit limit = descriptorLimit();
    const rlim_t wanted = std::min<rlim_t>(descriptorsFor(settings.limits), limit.rlim_max);
    if (limit.rlim_cur >= wanted) return limit.rlim_cur;
    limit.rlim_cur = wanted;
    ::setrlimit(RLIMIT_NOFILE, &limit);
    return descriptorLimit().rlim_cur;
}

std::vector<std::string> warningsOf(const Settings& settings, std::uint64_t descriptors) {
    std::vector<std::string> texts;
    if (settings.listen.http && !isLoopback(settings.listen.address))
        texts.push_back("listen.http sends passwords in clear text, and listen.address is " +
                        settings.listen.address +
                        ". Set listen.http = false, or listen.address = \"127.0.0.1\".");
    const std::uint64_t wanted = descriptorsFor(settings.limits);
    if (descriptors < wanted)
        texts.push_back("limits.connections is " + std::to_string(settings.limits.connections) +
                        ", which takes up to " + std::to_string(wanted) +
                        " open files, and this process may have " + std::to_string(descriptors) +
                        ". Raise LimitNOFILE of the service (or ulimit -n), or lower limits.connections.");
    return texts;
}

}  // namespace host
