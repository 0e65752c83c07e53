// SPDX-License-Identifier: Apache-2.0
// Loads two providers as a host does that knows nothing of them, closes them in the order given and prints
// what is left after each step. Arguments: the libraries in the order of loading, the counter of agents, and
// which of the two to close first, 0 or 1.
#include <dlfcn.h>

#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>

namespace {

void* load(const char* path) {
    void* const handle = dlopen(path, RTLD_NOW | RTLD_LOCAL);
    if (handle != nullptr) return handle;
    std::puts(dlerror());
    std::exit(1);
}

bool isMapped(const std::string& path) {
    std::ifstream maps("/proc/self/maps");
    for (std::string line; std::getline(maps, line);)
        if (line.ends_with(path)) return true;
    return false;
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 5) return 2;
    void* const providers[] = {load(argv[1]), load(argv[2])};
    void* const counter = load(argv[3]);
    const auto agentCount = reinterpret_cast<int (*)()>(dlsym(counter, "agentCount"));
    const int first = std::atoi(argv[4]);
    const auto report = [&] {
        std::printf("%d agents, mapped: %d %d\n", agentCount(), isMapped(argv[1]), isMapped(argv[2]));
    };
    report();
    dlclose(providers[first]);
    report();
    dlclose(providers[1 - first]);
    report();
    // The rest goes with its last user.
    dlclose(counter);
    std::printf("any: %d\n", isMapped("libQuenx_CimFramework.so") || isMapped("libQuenx_Utils.so"));
}
