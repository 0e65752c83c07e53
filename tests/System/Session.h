// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <fnmatch.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <sstream>
#include <string>

#include "Support/Program.h"
#include "Support/TempFolder.h"

namespace test {

/// Does in a folder what somebody at a shell does in a file of samples/sessions. Behind "$ " stands a
/// command, below it all that it prints, with * for anything, and its exit status in brackets unless that is
/// 0. Lines with "# " in front are for readers.
/// @param programs  the shell functions that give the programs the options of the test
inline void expectSession(const std::string& name, const TempFolder& folder, const std::string& programs) {
    const auto bytes = readTestFile(QUENX_SYSTEM_TEST_DIR "/samples/sessions/" + name);
    std::istringstream lines(std::string(bytes.begin(), bytes.end()) + "$ ");
    std::string command;
    std::string expected;
    for (std::string line; std::getline(lines, line);) {
        if (!line.starts_with("$ ")) {
            for (const char character : line.starts_with("# ") ? "" : line + "\n")
                expected += (std::string("[?\\").find(character) == std::string::npos ? "" : "\\") +
                            std::string(1, character);
            continue;
        }
        if (!command.empty()) {
            const ProgramResult result =
                run({"/bin/sh", "-c", "exec 2>&1; cd \"$0\"; eval \"$1\"", folder.path(), programs + command},
                    {"PATH=" QUENX_PROGRAMS ":/usr/bin:/bin"});
            const std::string shown =
                result.out + (result.status == 0 ? "" : "[" + std::to_string(result.status) + "]\n");
            EXPECT_EQ(::fnmatch(expected.c_str(), shown.c_str(), 0), 0) << "$ " << command << "\n" << shown;
        }
        command = line.substr(2);
        expected.clear();
    }
}

}  // namespace test
