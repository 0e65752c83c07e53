// SPDX-License-Identifier: Apache-2.0
#include "System/Quenxctl.h"

#include <sstream>

namespace test {

std::vector<std::string> wordsOf(const std::string& line, const std::string& image) {
    std::vector<std::string> words;
    std::istringstream stream(line);
    for (std::string word; std::getline(stream, word, ' ');)
        words.push_back(word == "IMAGE" ? image : word);
    return words;
}

void Quenxctl::describeAdapters(const std::string& fault) {
    std::string description = kTestAdapters;
    if (!fault.empty()) {
        description.insert(description.find("[[adapter]]\nname = \"eth1\""),
                           "[[adapter.fault]]\nat = \"write\"\n" + fault + "\n");
    }
    m_folder.write("adapters.toml", description);
}

std::vector<std::string> Quenxctl::command(const std::string& line) const {
    std::vector<std::string> all = {QUENXCTL, "--adapters", m_folder / "adapters.toml"};
    // Never the machine's own.
    if (!contains(line, "--config")) all.insert(all.end(), {"--config", m_configuration});
    const std::vector<std::string> words = wordsOf(line, m_image);
    all.insert(all.end(), words.begin(), words.end());
    return all;
}

void Quenxctl::expectError(const std::string& line, int status, const std::string& part) const {
    const ProgramResult result = quenxctl(line);
    EXPECT_EQ(result.status, status) << line << "\n" << result.out << result.error;
    EXPECT_TRUE(contains(result.error, part)) << line << "\n" << result.error << "\nwanted: " << part;
}

std::string Quenxctl::firmwareOf(const std::string& adapter) const {
    const std::string table = quenxctl("adapters").out;
    const std::size_t row = table.find("\n" + adapter + " ");
    if (row == std::string::npos) return "no such adapter in " + table;
    const std::size_t from = table.find("IMG_", row);
    return table.substr(from, table.find("  ", from) - from);
}

}  // namespace test
