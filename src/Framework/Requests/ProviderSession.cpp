// SPDX-License-Identifier: Apache-2.0
#include "Framework/Requests/ProviderSession.h"

#include <dlfcn.h>

#include <algorithm>
#include <exception>
#include <filesystem>
#include <utility>

#include "Framework/Requests/CimRequests.h"
#include "Utils/Build.h"

namespace core {

namespace {

constexpr const char* kPrefix = "libQuenx_";
constexpr const char* kSuffix = ".so";

#ifdef QUENX_SANITIZED
// A leak reported after unloading has no file and line unless the library stays mapped.
constexpr int kLoadFlags = RTLD_NOW | RTLD_LOCAL | RTLD_NODELETE;
#else
constexpr int kLoadFlags = RTLD_NOW | RTLD_LOCAL;
#endif

std::vector<std::filesystem::path> librariesIn(const std::string& directory) {
    std::vector<std::filesystem::path> files;
    for (const auto& entry : std::filesystem::directory_iterator(directory)) {
        const std::string name = entry.path().filename().string();
        if (name.starts_with(kPrefix) && name.ends_with(kSuffix)) files.push_back(entry.path());
    }
    std::sort(files.begin(), files.end());
    return files;
}

/// The loader's words for its failure just now, without the file, which it names first when it can.
std::string loaderReason(const std::string& file) {
    std::string reason = dlerror();
    if (reason.starts_with(file + ": ")) reason.erase(0, file.size() + 2);
    if (reason.find("quenx_build_") == std::string::npos) return reason;
    return std::string("it is of another build than the libraries in use, which are of build ") +
           utils::buildId() + " (" + reason + ")";
}

}  // namespace

std::string ProviderLibraries::defaultDirectory() {
    Dl_info own{};
    dladdr(kPrefix, &own);
    std::error_code error;
    return std::filesystem::weakly_canonical(own.dli_fname, error).parent_path().string();
}

void ProviderLibraries::Close::operator()(void* handle) const {
    dlclose(handle);
}

ProviderLibraries::~ProviderLibraries() {
    while (!m_handles.empty())
        m_handles.pop_back();
}

void ProviderLibraries::load(const std::string& directory) {
    for (const std::filesystem::path& file : librariesIn(directory)) {
        // An absolute path: a name without a slash would send the loader to its own search path.
        const std::string path = std::filesystem::absolute(file).string();
        Handle handle(dlopen(path.c_str(), kLoadFlags));
        if (handle == nullptr) {
            m_problems.push_back({file.string(), loaderReason(path)});
            continue;
        }
        m_handles.push_back(std::move(handle));
        m_loaded.push_back(file.string());
    }
}

LibraryEntry::LibraryEntry(const std::string& library, const char* name) {
    const std::string path = ProviderLibraries::defaultDirectory() + "/" + library;
    void* const handle = dlopen(path.c_str(), RTLD_NOW | RTLD_LOCAL | RTLD_NODELETE);
    if (handle != nullptr) m_address = dlsym(handle, name);
    if (m_address == nullptr) m_problem = path + ": " + loaderReason(path);
}

std::string ProviderSession::loadHistory() {
    // Where a disk hangs, the history's thread is in the library when everybody else has left.
    const LibraryEntry entry("history/libQuenx_History.so", "quenx_openHistory");
    using Open = void (*)(ProviderSession&);
    if (entry.address() == nullptr) return entry.problem();
    try {
        reinterpret_cast<Open>(entry.address())(*this);
        return "";
    } catch (const std::exception& error) {
        return error.what();
    }
}

ProviderSession::ProviderSession(const std::string& configurationFile, const std::string& policyFile)
    : m_policy(policyFile) {
    // Constructed first, since whoever asks for the current configuration from here on gets this one.
    if (!configurationFile.empty()) m_configuration.emplace(configurationFile);
    m_operations = std::make_shared<CimRequests>(utils::SMASHv2Config::getInstance()->getNamespace());
    // For the log: who has made a mistake is to hear of it before somebody needs an update.
    try {
        if (m_policy.current()->trust != utils::TrustRule::Off) m_verifier.load();
    } catch (const utils::PolicyError&) {
        // Nothing is installed until it is mended.
    }
}

}  // namespace core
