#include "Framework/ProviderLibraries.h"

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

}  // namespace

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
        Handle handle(dlopen(std::filesystem::absolute(file).c_str(), LOAD_FLAGS));
        if (handle == nullptr) {
            const char* reason = dlerror();
            problems_.push_back({file.string(), reason == nullptr ? "unknown reason" : reason});
            continue;
        }
        handles_.push_back(std::move(handle));
        loaded_.push_back(file.string());
    }
}

}  // namespace core
