// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <curl/curl.h>

#include <stdexcept>
#include <string>

namespace control {

/// The HTTP library could not be loaded.
class NoCurlLibrary : public std::runtime_error {
  public:
    /// @param why  in the loader's words
    explicit NoCurlLibrary(const std::string& why)
        : std::runtime_error("cannot load the HTTP library: " + why + "; install the package libcurl4"),
          m_why(why) {}
    const std::string& why() const { return m_why; }

  private:
    std::string m_why;
};

/// The functions of the HTTP library, which is loaded when the first server or listener is asked: it and the
/// thirty libraries that it needs take longer to load than a command in process takes to run, and a server
/// that nobody subscribes to would keep them in memory for nothing.
struct CurlLibrary {
    decltype(&::curl_global_init) globalInit;
    decltype(&::curl_easy_init) easyInit;
    decltype(&::curl_easy_cleanup) easyCleanup;
    decltype(&::curl_easy_setopt) easySetopt;
    decltype(&::curl_easy_perform) easyPerform;
    decltype(&::curl_easy_getinfo) easyGetinfo;
    decltype(&::curl_easy_strerror) easyStrerror;
    decltype(&::curl_multi_init) multiInit;
    decltype(&::curl_multi_cleanup) multiCleanup;
    decltype(&::curl_multi_add_handle) multiAddHandle;
    decltype(&::curl_multi_remove_handle) multiRemoveHandle;
    decltype(&::curl_multi_perform) multiPerform;
    decltype(&::curl_multi_poll) multiPoll;
    decltype(&::curl_multi_wakeup) multiWakeup;
    decltype(&::curl_multi_info_read) multiInfoRead;
    decltype(&::curl_slist_append) slistAppend;
    decltype(&::curl_slist_free_all) slistFreeAll;
    decltype(&::curl_url) url;
    decltype(&::curl_url_cleanup) urlCleanup;
    decltype(&::curl_url_get) urlGet;
    decltype(&::curl_url_set) urlSet;
    decltype(&::curl_url_strerror) urlStrerror;
    decltype(&::curl_free) free;
};

/// Thread-safe. Stays loaded.
/// @throws NoCurlLibrary  and tries again with the next call
const CurlLibrary& curl();

}  // namespace control
