// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <filesystem>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace test {

/// A new empty folder, removed with everything in it at the end of the scope.
class TempFolder {
  public:
    TempFolder();
    TempFolder(const TempFolder&) = delete;
    TempFolder& operator=(const TempFolder&) = delete;
    ~TempFolder();

    std::string path() const { return m_path.string(); }
    std::string operator/(std::string_view name) const { return (m_path / name).string(); }

    /// Writes a file in the folder and returns its path; a failed expectation when that does not work.
    std::string write(std::string_view name, std::string_view content) const;
    std::string write(std::string_view name, std::span<const std::uint8_t> content) const;

  private:
    std::filesystem::path m_path;
};

/// All bytes of a file; a failed expectation and nothing when it cannot be read.
std::vector<std::uint8_t> readTestFile(const std::string& path);

/// The rows of a sample: each begins with a line, and has those below it that are indented by four blanks.
/// Empty lines and comments are left out. A failed expectation when there are none.
std::vector<std::vector<std::string>> readTestTable(const std::string& path);

}  // namespace test
