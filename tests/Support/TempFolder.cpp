#include "Support/TempFolder.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <system_error>

namespace test {

namespace {

using File = std::unique_ptr<FILE, int (*)(FILE*)>;

}  // namespace

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
    writeTestFile(path, content);
    return path;
}

std::string TempFolder::write(std::string_view name, std::span<const uint8_t> content) const {
    return write(name, std::string(content.begin(), content.end()));
}

void writeTestFile(const std::string& path, std::string_view content) {
    const File file(std::fopen(path.c_str(), "wb"), &std::fclose);
    const std::size_t written = file ? std::fwrite(content.data(), 1, content.size(), file.get()) : 0;
    EXPECT_TRUE(file && written == content.size()) << path;
}

std::vector<uint8_t> readTestFile(const std::string& path) {
    const File file(std::fopen(path.c_str(), "rb"), &std::fclose);
    EXPECT_TRUE(file) << path;
    if (!file) return {};
    std::vector<uint8_t> bytes(static_cast<std::size_t>(std::filesystem::file_size(path)));
    bytes.resize(std::fread(bytes.data(), 1, bytes.size(), file.get()));
    return bytes;
}

}  // namespace test
