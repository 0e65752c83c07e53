// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <gmock/gmock.h>

#include <sstream>
#include <string>
#include <vector>

#include "Support/Program.h"
#include "Support/SimulatedAdapters.h"
#include "Support/TempFolder.h"
#include "Support/TestRoms.h"

namespace test {

/// The command with the words of a line: what stands between its spaces. The word IMAGE becomes the image's
/// path.
inline std::vector<std::string> withWordsOf(const std::string& line, const std::string& image,
                                            std::vector<std::string> words) {
    std::istringstream stream(line);
    for (std::string word; std::getline(stream, word, ' ');)
        words.push_back(word == "IMAGE" ? image : word);
    return words;
}

/// The command as the user nobody, whom only root can become.
inline std::vector<std::string> asNobody(std::vector<std::string> command) {
    command.insert(command.begin(), {"/usr/bin/setpriv", "--reuid=65534", "--regid=65534", "--clear-groups"});
    return command;
}

/// Why this test cannot be another user; empty where it can.
inline std::string whyNotNobody() {
    if (::geteuid() != 0) return "needs root, to become another user";
    const bool isReached = run(asNobody({QUENXCTL, "--version"})).status == 0;
    return isReached ? "" : "other users do not get into the folder of the build";
}

/// quenxctl on simulated adapters of its own, those of SimulatedAdapters.h.
class Quenxctl : public ::testing::Test {
  protected:
    /// The program, the options that make its environment, and the words of the line.
    virtual std::vector<std::string> command(const std::string& line) const {
        // Never the machine's own settings.
        return withWordsOf(
            line, m_image,
            {QUENXCTL, "--adapters", m_adapters, "--config", m_defaults, "--policy", m_policy});
    }
    ProgramResult quenxctl(const std::string& line, const std::vector<std::string>& environment = {}) const {
        return run(command(line), environment);
    }
    /// Runs it, and expects this exit status and this in the error text.
    void expectError(const std::string& line, int status, const std::string& part) const {
        const ProgramResult result = quenxctl(line);
        EXPECT_EQ(result.status, status) << line << "\n" << result.out << result.error;
        EXPECT_THAT(result.error, ::testing::HasSubstr(part)) << line;
    }
    /// Runs it, and expects success and this in the output.
    void expectOutput(const std::string& line, const std::string& part) const {
        const ProgramResult result = quenxctl(line);
        EXPECT_EQ(result.status, 0) << line << "\n" << result.error;
        EXPECT_THAT(result.out, ::testing::HasSubstr(part)) << line;
    }
    /// "IMG_PXE 1, IMG_UEFI 0": what an adapter carries, as a new process sees it.
    std::string firmwareOf(const std::string& adapter) const {
        const std::string table = quenxctl("adapters").out;
        const std::size_t from = table.find("IMG_", table.find("\n" + adapter + " "));
        return table.substr(from, table.find("  ", from) - from);
    }

    TempFolder m_folder;
    std::string m_adapters = m_folder.write("adapters.toml", kTestAdapters);
    std::string m_defaults = m_folder.write("default.conf", "");
    std::string m_policy = m_folder.write("policy.toml", "# As if there were none.\n");
    /// For eth0 and eth1: a real one with IMG_PXE 2 and IMG_UEFI 2.
    std::string m_image = m_folder.write("new.rom", withRevision(realRom("efi-virtio"), 2));
};

}  // namespace test
