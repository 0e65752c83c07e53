// SPDX-License-Identifier: Apache-2.0
#include "Cli/Connection/CurlLibrary.h"

#include <dlfcn.h>

#include <string>

#include "Cli/Display/Messages.h"

namespace cli {

namespace {

/// Its binary interface; the headers that this is compiled with are the same one's.
constexpr const char* kFile = "libcurl.so.4";

[[noreturn]] void refuse() {
    const char* why = ::dlerror();
    throw CommandError(
        ExitStatus::Failed,
        std::string("Cannot load the HTTP library: ") + (why == nullptr ? kFile : why) + ".",
        "Install the package libcurl4, or run quenxctl on the server itself, without --server.");
}

template <class Function>
void find(void* library, const char* name, Function& function) {
    function = reinterpret_cast<Function>(::dlsym(library, name));
    if (function == nullptr) refuse();
}

CurlLibrary load() {
    void* library = ::dlopen(kFile, RTLD_NOW | RTLD_LOCAL);
    if (library == nullptr) refuse();
    CurlLibrary found{};
    find(library, "curl_easy_init", found.easyInit);
    find(library, "curl_easy_cleanup", found.easyCleanup);
    find(library, "curl_easy_setopt", found.easySetopt);
    find(library, "curl_easy_perform", found.easyPerform);
    find(library, "curl_easy_getinfo", found.easyGetinfo);
    find(library, "curl_easy_strerror", found.easyStrerror);
    find(library, "curl_slist_append", found.slistAppend);
    find(library, "curl_slist_free_all", found.slistFreeAll);
    find(library, "curl_url", found.url);
    find(library, "curl_url_cleanup", found.urlCleanup);
    find(library, "curl_url_get", found.urlGet);
    find(library, "curl_url_set", found.urlSet);
    find(library, "curl_url_strerror", found.urlStrerror);
    find(library, "curl_free", found.free);
    return found;
}

}  // namespace

const CurlLibrary& curl() {
    static const CurlLibrary kLibrary = load();
    return kLibrary;
}

}  // namespace cli
