// SPDX-License-Identifier: Apache-2.0
#include "History/KeptImages.h"

#include <algorithm>
#include <filesystem>
#include <stdexcept>
#include <string_view>
#include <vector>

#include "History/Look.h"
#include "History/Store.h"
#include "Utils/Os/Linux/OwnFiles.h"
#include "Utils/Os/Linux/PatientReading.h"
#include "Utils/Utils.h"

namespace history {

namespace fs = std::filesystem;

namespace {

/// The file where its bytes have the sum. Its file system may hang, which must hold up no record.
std::optional<os::FileLook> contentOf(const std::string& path, const std::string& sha256,
                                      std::int64_t bytes) {
    if (sha256.empty()) return std::nullopt;
    os::Patience patience;
    std::optional<os::FileLook> file = os::lookAtFile(path, bytes, patience);
    const bool isWhole = file && file->kind == os::FileKind::Regular && file->size == bytes &&
                         file->count == static_cast<std::size_t>(bytes);
    if (!isWhole || factsOf({file->bytes.get(), file->count}).sha256 != sha256) return std::nullopt;
    return file;
}

/// The path in a file URI.
std::string pathOf(const std::string& uri) {
    constexpr std::string_view kScheme = "file://";
    return uri.starts_with(kScheme) ? uri.substr(kScheme.size()) : "";
}

/// The newest stay.
void removeOldest(const std::string& folder, const std::string& prefix) {
    std::vector<fs::path> kept;
    for (const fs::directory_entry& entry : fs::directory_iterator(folder))
        if (entry.path().filename().string().starts_with(prefix)) kept.push_back(entry.path());
    std::ranges::sort(kept, std::ranges::greater(),
                      [](const auto& path) { return fs::last_write_time(path); });
    for (std::size_t i = kKeptForEachModel; i < kept.size(); ++i)
        fs::remove(kept[i]);
}

}  // namespace

void keepImage(const std::string& folder, const std::string& model, const Record& record) {
    const auto content = contentOf(pathOf(record.uri), record.sha256, record.bytes.value_or(0));
    if (!content) throw std::runtime_error(record.uri + " is no longer the file that was written");
    std::string prefix = model + "-";
    utils::replaceCharacter(prefix, ':', '-');
    os::makeOwnFolder(folder);
    // One that is there is written again, and so becomes the newest.
    constexpr mode_t kOwnersAlone = 0600;
    os::replaceFile(folder + "/" + prefix + record.sha256,
                    {reinterpret_cast<const char*>(content->bytes.get()), content->count}, kOwnersAlone);
    removeOldest(folder, prefix);
}

bool hasSum(const std::string& path, const std::string& sha256, std::int64_t bytes) try {
    return contentOf(path, sha256, bytes).has_value();
} catch (const std::exception&) {
    return false;
}

std::optional<std::string> findImage(const std::string& folder, const std::string& sha256,
                                     std::int64_t bytes) {
    std::error_code error;
    fs::recursive_directory_iterator each(folder, fs::directory_options::skip_permission_denied, error);
    for (; !error && each != fs::recursive_directory_iterator(); each.increment(error))
        if (!each->is_symlink(error) && hasSum(each->path(), sha256, bytes)) return each->path();
    return std::nullopt;
}

}  // namespace history
