// SPDX-License-Identifier: Apache-2.0
#include "Indications/Delivery/Destination.h"

#include <algorithm>
#include <memory>
#include <string_view>

#include "Control/CurlLibrary.h"
#include "Framework/Model/CimError.h"

namespace indications {

namespace {

using control::curl;
using control::CurlLibrary;

/// Never with the URL in it, which may hold a password.
[[noreturn]] void refuse(const std::string& reason) {
    throw core::CimError(core::CimStatus::InvalidParameter,
                         "Destination " + reason + "; write it as http://host:port/path or https://...");
}

std::string partOf(CURLU* url, CURLUPart part) {
    char* text = nullptr;
    if (curl().urlGet(url, part, &text, 0) != CURLUE_OK) return "";
    const std::unique_ptr<char, decltype(CurlLibrary::free)> owned(text, curl().free);
    return text;
}

}  // namespace

void requireDestination(const std::string& url) {
    if (url.empty()) refuse("is empty");
    if (url.size() > kLongestDestination) refuse("is longer than 1024 bytes");
    const auto isOfUrl = [](char each) { return each > ' ' && each < '\x7F'; };
    if (!std::ranges::all_of(url, isOfUrl)) refuse("holds a blank or a character that is none of a URL");
    const std::unique_ptr<CURLU, decltype(CurlLibrary::urlCleanup)> parts(curl().url(), curl().urlCleanup);
    if (parts == nullptr) throw std::bad_alloc();
    const CURLUcode error =
        curl().urlSet(parts.get(), CURLUPART_URL, url.c_str(),
                      CURLU_NON_SUPPORT_SCHEME | CURLU_DEFAULT_SCHEME | CURLU_GUESS_SCHEME);
    if (error != CURLUE_OK) refuse(std::string("is no URL: ") + curl().urlStrerror(error));
    const std::string scheme = partOf(parts.get(), CURLUPART_SCHEME);
    if (scheme != "http" && scheme != "https") refuse("has the scheme " + scheme);
    const bool hasSecrets =
        !partOf(parts.get(), CURLUPART_USER).empty() || !partOf(parts.get(), CURLUPART_PASSWORD).empty();
    if (hasSecrets) refuse("holds a name or a password, which everybody could read");
}

}  // namespace indications
