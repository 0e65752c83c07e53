// SPDX-License-Identifier: Apache-2.0
// For targets whose refusals would each write a backtrace.
#include "Utils/Log.h"

extern "C" int LLVMFuzzerInitialize(int*, char***) {
    utils::openLinuxLog();
    utils::logLevel = 0;
    return 0;
}
