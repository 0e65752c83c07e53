// SPDX-License-Identifier: Apache-2.0
#include "Cli/ServerUrl.h"

#include <arpa/inet.h>
#include <curl/curl.h>

#include <memory>

#include "Cli/Failure.h"

namespace cli {

namespace {

constexpr const char* HTTPS_PORT = "5989";
constexpr const char* HTTP_PORT = "5988";
constexpr const char* CIM_PATH = "/cimom";

using Url = std::unique_ptr<CURLU, decltype(&curl_url_cleanup)>;

[[noreturn]] void refuse(const std::string& text, const std::string& why) {
    // What stands before an @ may be a password.
    const std::string shown = text.find('@') == std::string::npos ? " \"" + text + "\"" : std::string();
    throw Failure(ExitStatus::WrongUse, "--server" + shown + " " + why + ".",
                  "Write it as https://host:5989.");
}

/// Empty when the URL has no such part.
std::string partOf(const Url& url, CURLUPart part) {
    char* text = nullptr;
    if (curl_url_get(url.get(), part, &text, 0) != CURLUE_OK) return {};
    std::string result = text;
    curl_free(text);
    return result;
}

bool isLoopbackHost(const std::string& host) {
    in_addr address{};
    if (inet_pton(AF_INET, host.c_str(), &address) == 1) return (ntohl(address.s_addr) >> 24) == 127;
    return host == "localhost" || host == "[::1]";
}

}  // namespace

ServerUrl::ServerUrl(const std::string& text) {
    if (text.find("://") == std::string::npos) refuse(text, "does not begin with https:// or http://");
    const Url url(curl_url(), curl_url_cleanup);
    const CURLUcode error = curl_url_set(url.get(), CURLUPART_URL, text.c_str(), CURLU_NON_SUPPORT_SCHEME);
    if (error != CURLUE_OK) refuse(text, std::string("is not a URL: ") + curl_url_strerror(error));
    const std::string scheme = partOf(url, CURLUPART_SCHEME);
    if (scheme != "https" && scheme != "http") refuse(text, "does not begin with https:// or http://");
    if (!partOf(url, CURLUPART_USER).empty() || !partOf(url, CURLUPART_PASSWORD).empty()) {
        throw Failure(
            ExitStatus::WrongUse, "--server holds a user name or a password.",
            "Name the user with --user, and leave the password to QUENXCTL_PASSWORD or the prompt.");
    }
    isEncrypted_ = scheme == "https";
    if (partOf(url, CURLUPART_PORT).empty()) {
        curl_url_set(url.get(), CURLUPART_PORT, isEncrypted_ ? HTTPS_PORT : HTTP_PORT, 0);
    }
    if (partOf(url, CURLUPART_PATH) == "/") curl_url_set(url.get(), CURLUPART_PATH, CIM_PATH, 0);
    isLoopback_ = isLoopbackHost(partOf(url, CURLUPART_HOST));
    text_ = partOf(url, CURLUPART_URL);
}

}  // namespace cli
