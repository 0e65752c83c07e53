// SPDX-License-Identifier: Apache-2.0
#include "Support/TempFolder.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <system_error>

namespace test {

TempFolder::TempFolder() {
    std::string pattern = (std::filesystem::temp_directory_path() / "quenx-test-XXXXXX").string();
    if (::mkdtemp(pattern.data()) == nullptr)
        throw std::system_error(errno, std::generic_category(), pattern);
    m_path = pattern;
}

TempFolder::~TempFolder() {
    std::error_code ignored;
    std::filesystem::remove_all(m_path, ignored);
}

std::string TempFolder::write(std::string_view name, std::string_view content) const {
    const std::string path = *this / name;
    std::ofstream file(path, std::ios::binary);
    EXPECT_TRUE(file << content << std::flush) << path;
    return path;
}

std::string TempFolder::write(std::string_view name, std::span<const std::uint8_t> content) const {
    return write(name, std::string(content.begin(), content.end()));
}

std::vector<std::uint8_t> readTestFile(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    EXPECT_TRUE(file) << path;
    return {std::istreambuf_iterator<char>(file), {}};
}

std::vector<std::vector<std::string>> readTestTable(const std::string& path) {
    std::ifstream file(path);
    std::vector<std::vector<std::string>> rows;
    for (std::string line; std::getline(file, line);) {
        if (line.empty() || line.starts_with('#')) continue;
        if (line.starts_with("    "))
            rows.at(rows.size() - 1).push_back(line.substr(4));
        else
            rows.push_back({line});
    }
    EXPECT_FALSE(rows.empty()) << path;
    return rows;
}

}  // namespace test
