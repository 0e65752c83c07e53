#pragma once

#include "Utils/Log.h"

/// For targets whose refusals would each write a backtrace.
inline void beQuiet() {
    utils::openLinuxLog();
    utils::logLevel = 0;
}
