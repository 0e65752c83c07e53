// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdlib>
#include <string>

#include "Utils/Log.h"

/// What a program of the fuzzer does with an input. Each defines its own.
void fuzz(const std::string& bytes);

/// What must hold for every input: a finding of the fuzzer when it does not.
inline void require(bool condition) {
    if (!condition) std::abort();
}

/// libFuzzer calls it first. Refusals would each write a backtrace, which takes most of the time.
extern "C" int LLVMFuzzerInitialize(int*, char***) {
    utils::openLinuxLog();
    utils::logLevel = 0;
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    fuzz(std::string(data, data + size));
    return 0;
}
