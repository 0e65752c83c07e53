#include "Framework/Requests/ProviderLibraries.h"

#include <dlfcn.h>

#include <algorithm>
#include <filesystem>

namespace core {

namespace {

constexpr const char* PREFIX = "libQuenx_";
constexpr const char* SUFFIX = ".so";

#ifdef QUENX_SANITIZED
// A leak reported after unloading has no file and line unless the library stays mapped.
constexpr int LOAD_FLAGS = RTLD_NOW | RTLD_LOCAL | RTLD_NODELETE;
#else
constexpr int LOAD_FLAGS = RTLD_NOW | RTLD_LOCAL;
#endif

std::vector<std::filesystem::path> librariesIn(const std::string& directory) {
    std::vector<std::filesystem::path> files;
    for (const auto& entry : std::filesystem::directory_iterator(directory)) {
        const std::string name = entry.path().filename().string();
        if (name.starts_with(PREFIX) && name.ends_with(SUFFIX)) files.push_back(entry.path());
    }
    std::sort(files.begin(), files.end());
    return files;
}

/// The loader's words for its latest failure, without the file, which it names first when it can.
std::string loaderReason(const std::string& file) {
    const char* text = dlerror();
    const std::string reason = text == nullptr ? "unknown reason" : text;
    return reason.starts_with(file + ": ") ? reason.substr(file.size() + 2) : reason;
}

}  // namespace

std::string ProviderLibraries::defaultDirectory() {
    Dl_info own{};
    dladdr(PREFIX, &own);
    std::error_code error;
    return std::filesystem::weakly_canonical(own.dli_fname, error).parent_path().string();
}

void ProviderLibraries::Close::operator()(void* handle) const {
    dlclose(handle);
}

ProviderLibraries::~ProviderLibraries() {
    while (!handles_.empty())
        handles_.pop_back();
}

void ProviderLibraries::load(const std::string& directory) {
    for (const std::filesystem::path& file : librariesIn(directory)) {
        // An absolute path: a name without a slash would send the loader to its own search path.
        const std::string path = std::filesystem::absolute(file).string();
        Handle handle(dlopen(path.c_str(), LOAD_FLAGS));
        if (handle == nullptr) {
            problems_.push_back({file.string(), loaderReason(path)});
            continue;
        }
        handles_.push_back(std::move(handle));
        loaded_.push_back(file.string());
    }
}

}  // namespace core
