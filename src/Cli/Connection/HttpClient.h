// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <curl/curl.h>

#include <array>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "Cli/Connection/Connection.h"

namespace cli {

/// The largest answer that is taken: a broken or hostile server must not fill the memory.
inline constexpr std::size_t kLargestAnswer = std::size_t{64} << 20;

struct HttpReply {
    long status = 0;
    std::string body;
    bool isTooLarge = false;  ///< the rest was not read
    std::string cimError;     ///< the header of that name
    std::string retryAfter;   ///< likewise, in seconds
};

/// Throws NoAnswer that says so.
[[noreturn]] void refuseLargeAnswer(const std::string& url, std::size_t limit);

/// Requests to one server over one connection. Used from one thread.
class HttpClient {
  public:
    HttpClient(const ServerSettings& settings, const std::string& user, const std::string& password,
               std::function<bool()> isInterrupted);
    HttpClient(const HttpClient&) = delete;
    HttpClient& operator=(const HttpClient&) = delete;

    /// Sends a body of XML. Throws CommandError when it could not be sent, NoAnswer when only the answer is
    /// missing.
    HttpReply post(const std::vector<std::string>& headers, const std::string& body);

  private:
    template <class T>
    void set(CURLoption option, T value) {
        curl_easy_setopt(m_curl.get(), option, value);
    }
    [[noreturn]] void refuse(CURLcode code, bool isTooLarge) const;

    std::unique_ptr<CURL, decltype(&curl_easy_cleanup)> m_curl;
    std::array<char, CURL_ERROR_SIZE> m_error{};
    std::string m_url;
    bool m_isLocal;  ///< over a Unix socket
    bool m_namesCaFile;
    std::function<bool()> m_isInterrupted;
};

}  // namespace cli
