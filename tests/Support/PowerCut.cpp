#include "Support/PowerCut.h"

#include <filesystem>

#include "Support/TempFolder.h"

namespace test {

namespace fs = std::filesystem;

namespace {

std::string parentOf(const std::string& path) {
    return fs::path(path).parent_path().string();
}

}  // namespace

void CutFiles::makeFolder(const std::string& path) {
    count();
    FlashFiles::makeFolder(path);
    m_entries[path] = nullptr;
}

int CutFiles::create(const std::string& path) {
    count();
    std::shared_ptr<Content>& content = m_entries[path];
    if (!content) content = std::make_shared<Content>();
    content->now.clear();
    const int descriptor = FlashFiles::create(path);
    m_open[descriptor] = content;
    return descriptor;
}

void CutFiles::write(int descriptor, std::span<const uint8_t> bytes) {
    const bool cut = m_calls + 1 == m_cutAt;
    const std::span<const uint8_t> reaching = cut ? bytes.first(bytes.size() / 2) : bytes;
    std::vector<uint8_t>& now = m_open[descriptor]->now;
    now.insert(now.end(), reaching.begin(), reaching.end());
    FlashFiles::write(descriptor, reaching);
    count();
}

void CutFiles::sync(int descriptor) {
    count();
    m_open[descriptor]->synced = m_open[descriptor]->now;
}

void CutFiles::rename(const std::string& from, const std::string& to) {
    count();
    FlashFiles::rename(from, to);
    m_entries[to] = m_entries[from];
    m_entries.erase(from);
}

void CutFiles::syncFolder(const std::string& path) {
    count();
    std::erase_if(m_syncedEntries, [&](const auto& entry) { return parentOf(entry.first) == path; });
    for (const auto& entry : m_entries)
        if (parentOf(entry.first) == path) m_syncedEntries.insert(entry);
}

void CutFiles::lose(const Medium& medium, const std::string& root) const {
    const auto& entries = medium.keepsEntries ? m_entries : m_syncedEntries;
    for (const auto& found : fs::recursive_directory_iterator(root)) {
        const bool isFlash = found.is_regular_file() && found.path().extension() != ".lock";
        if (isFlash) fs::remove(found.path());
    }
    for (const auto& [path, content] : entries) {
        if (!content || !fs::exists(parentOf(path))) continue;
        const std::vector<uint8_t>& bytes = medium.keepsContents ? content->now : content->synced;
        writeTestFile(path, std::string(bytes.begin(), bytes.end()));
    }
}

void CutFiles::adopt(const std::string& root) {
    for (const auto& found : fs::recursive_directory_iterator(root)) {
        if (found.is_directory()) m_entries[found.path().string()] = nullptr;
        if (!found.is_regular_file() || found.path().extension() == ".lock") continue;
        const std::vector<uint8_t> bytes = readTestFile(found.path().string());
        m_entries[found.path().string()] = std::make_shared<Content>(Content{bytes, bytes});
    }
    m_syncedEntries = m_entries;
}

}  // namespace test
