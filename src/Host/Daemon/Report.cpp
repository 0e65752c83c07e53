// SPDX-License-Identifier: Apache-2.0
#include "Host/Daemon/Report.h"

#include <iostream>

#include "Utils/Log.h"

namespace host {

namespace {

/// One write, so that lines of several threads do not mix.
void say(const std::string& text) {
    std::cerr << "quenx-cimd: " + text + "\n";
}

}  // namespace

void report(const std::string& text) {
    say(text);
    QUENX_DEBUG_TEXT(text);
}

void reportProblem(const std::string& text) {
    say(text);
    QUENX_ERROR_TEXT(text);
}

}  // namespace host
