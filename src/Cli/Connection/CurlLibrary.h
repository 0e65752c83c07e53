// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <curl/curl.h>

namespace cli {

/// The functions of the HTTP library, which is loaded when the first server is asked: it and the thirty
/// libraries that it needs take longer to load than a command in process takes to run.
struct CurlLibrary {
    decltype(&::curl_easy_init) easyInit;
    decltype(&::curl_easy_cleanup) easyCleanup;
    decltype(&::curl_easy_setopt) easySetopt;
    decltype(&::curl_easy_perform) easyPerform;
    decltype(&::curl_easy_getinfo) easyGetinfo;
    decltype(&::curl_easy_strerror) easyStrerror;
    decltype(&::curl_slist_append) slistAppend;
    decltype(&::curl_slist_free_all) slistFreeAll;
    decltype(&::curl_url) url;
    decltype(&::curl_url_cleanup) urlCleanup;
    decltype(&::curl_url_get) urlGet;
    decltype(&::curl_url_set) urlSet;
    decltype(&::curl_url_strerror) urlStrerror;
    decltype(&::curl_free) free;
};

/// Throws CommandError, where the library is not installed. Stays loaded.
const CurlLibrary& curl();

}  // namespace cli
