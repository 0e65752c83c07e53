#include "Reliability/Effort.h"

#include <cinttypes>
#include <cstdio>
#include <map>
#include <mutex>

namespace test {

namespace {

struct Figures {
    std::mutex mutex;
    std::map<std::string, std::uint64_t> counts;
};

Figures& figures() {
    static Figures instance;
    return instance;
}

}  // namespace

Effort& effort() {
    static Effort instance;
    return instance;
}

void count(const std::string& figure, std::uint64_t number) {
    const std::lock_guard lock(figures().mutex);
    figures().counts[figure] += number;
}

void printFigures() {
    for (const auto& [name, number] : figures().counts)
        std::printf("| %s | %" PRIu64 " |\n", name.c_str(), number);
}

}  // namespace test
