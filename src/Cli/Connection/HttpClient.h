// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "Cli/Connection/Connection.h"
#include "Control/CurlLibrary.h"

namespace cli {

/// The largest answer that is taken: a broken or hostile server must not fill the memory.
inline constexpr std::size_t kLargestAnswer = std::size_t{64} << 20;

struct HttpReply {
    long status = 0;
    std::string body;
    bool isTooLarge = false;  ///< the rest was not read
    std::string cimError;     ///< the header of that name
    std::string retryAfter;   ///< likewise, in seconds
    bool isControl = false;   ///< has the header of quenx-cimd's own paths
};

/// A request for one of quenx-cimd's own paths.
struct ControlRequest {
    const char* method;
    std::string path;
    std::vector<std::string> headers = {};
    std::string body = {};
    int file = -1;                ///< what a PUT sends, from where it stands
    std::uint64_t fileBytes = 0;  ///< how much of it
};

/// Throws CommandError, for a reply that is no answer to the request itself. NoAnswer where the server may
/// have carried it out.
void requireOk(const HttpReply& reply);

/// Throws NoAnswer that says so.
[[noreturn]] void refuseLargeAnswer(const std::string& url, std::size_t limit);

/// Whether a request may be sent again when a kept connection turns out to be closed. What changes something,
/// or takes something away, must not be: the server may have carried it out.
enum class Sending { AsOftenAsNeeded, Once };

/// Requests to one server over one connection. Used from one thread.
class HttpClient {
  public:
    HttpClient(const ServerSettings& settings, const std::string& user, const std::string& password,
               std::function<bool()> isInterrupted);
    HttpClient(const HttpClient&) = delete;
    HttpClient& operator=(const HttpClient&) = delete;

    /// Sends a body of XML. Throws CommandError when it could not be sent, NoAnswer when only the answer is
    /// missing.
    HttpReply post(const std::vector<std::string>& headers, const std::string& body, Sending sending);
    /// The same for another path of the server. One client does either this or post().
    HttpReply send(const ControlRequest& request);

  private:
    template <class T>
    void set(CURLoption option, T value) {
        control::curl().easySetopt(m_curl.get(), option, value);
    }
    void bePatient(bool sendsFile);
    HttpReply perform(const std::vector<std::string>& headers, Sending sending);
    [[noreturn]] void refuse(CURLcode code, bool isTooLarge) const;

    std::unique_ptr<CURL, decltype(control::CurlLibrary::easyCleanup)> m_curl;
    std::array<char, CURL_ERROR_SIZE> m_error{};
    std::string m_url;
    std::string m_root;  ///< scheme, host and port
    bool m_isLocal;      ///< over a Unix socket
    bool m_namesCaFile;
    std::function<bool()> m_isInterrupted;
    int m_attempts = 0;  ///< that the library may still make; negative when it was kept from one
};

}  // namespace cli
