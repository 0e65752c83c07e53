// SPDX-License-Identifier: Apache-2.0
#include "Control/CurlLibrary.h"

#include "Utils/Os/Linux/LoadedLibrary.h"

namespace control {

namespace {

CurlLibrary load() {
    // The headers that this is compiled with are the same interface's.
    os::LoadedLibrary library("libcurl.so.4");
    CurlLibrary found{};
    library.find("curl_global_init", found.globalInit);
    library.find("curl_easy_init", found.easyInit);
    library.find("curl_easy_cleanup", found.easyCleanup);
    library.find("curl_easy_setopt", found.easySetopt);
    library.find("curl_easy_perform", found.easyPerform);
    library.find("curl_easy_getinfo", found.easyGetinfo);
    library.find("curl_easy_strerror", found.easyStrerror);
    library.find("curl_multi_init", found.multiInit);
    library.find("curl_multi_cleanup", found.multiCleanup);
    library.find("curl_multi_add_handle", found.multiAddHandle);
    library.find("curl_multi_remove_handle", found.multiRemoveHandle);
    library.find("curl_multi_perform", found.multiPerform);
    library.find("curl_multi_poll", found.multiPoll);
    library.find("curl_multi_wakeup", found.multiWakeup);
    library.find("curl_multi_info_read", found.multiInfoRead);
    library.find("curl_slist_append", found.slistAppend);
    library.find("curl_slist_free_all", found.slistFreeAll);
    library.find("curl_url", found.url);
    library.find("curl_url_cleanup", found.urlCleanup);
    library.find("curl_url_get", found.urlGet);
    library.find("curl_url_set", found.urlSet);
    library.find("curl_url_strerror", found.urlStrerror);
    library.find("curl_free", found.free);
    if (!library.problem().empty()) throw NoCurlLibrary(library.problem());
    return found;
}

}  // namespace

const CurlLibrary& curl() {
    static const CurlLibrary kLibrary = load();
    return kLibrary;
}

}  // namespace control
