// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/Caller.h"

#include "MidAPI/Devlink/Machine.h"
#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

/// The rest of the line, or the variable, that begins with this; empty where there is none.
std::string valueOf(const std::string& text, char separator, std::string_view beginning) {
    for (const std::string& line : utils::split(text, separator))
        if (line.starts_with(beginning)) return utils::trim(line.substr(beginning.size()));
    return {};
}

}  // namespace

std::string findCaller(Machine& machine) {
    // The client's address and port, then the server's. "sudo" takes it out of the environment of what it
    // starts, and has it itself.
    constexpr std::string_view kVariable = "SSH_CONNECTION=";
    constexpr int kMostAncestors = 64;
    std::string process = "self";
    for (int step = 0; step < kMostAncestors && !process.empty() && process != "0"; ++step) {
        const std::string folder = "/proc/" + process;
        const std::string ends = valueOf(machine.readFile(folder + "/environ").value_or(""), '\0', kVariable);
        if (!ends.empty()) return ends.substr(0, ends.find(' '));
        process = valueOf(machine.readFile(folder + "/status").value_or(""), '\n', "PPid:");
    }
    return {};
}

}  // namespace ma::devlink
