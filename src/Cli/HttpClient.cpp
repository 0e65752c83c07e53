// SPDX-License-Identifier: Apache-2.0
#include "Cli/HttpClient.h"

#include <curl/curl.h>

#include <string_view>

#include "Cli/Failure.h"
#include "Framework/Model/CimType.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

constexpr long CONNECT_SECONDS = 15;
/// An answer may have to wait for the verification of a large image.
constexpr long ANSWER_SECONDS = 120;
constexpr std::size_t LARGEST_ANSWER = std::size_t{256} << 20;

std::size_t takeBody(char* data, std::size_t, std::size_t count, void* to) {
    auto& body = static_cast<HttpReply*>(to)->body;
    if (count > LARGEST_ANSWER - body.size()) return 0;
    body.append(data, count);
    return count;
}

std::size_t takeHeader(char* data, std::size_t, std::size_t count, void* to) {
    auto& reply = *static_cast<HttpReply*>(to);
    const std::string_view line(data, count);
    const std::size_t colon = line.find(':');
    if (colon == std::string_view::npos) return count;
    const auto keep = [&](std::string_view name, std::string& value) {
        if (!core::sameName(line.substr(0, colon), name)) return;
        value = std::string(utils::trimOf(line.substr(colon + 1), " \t\r\n"));
    };
    keep("CIMError", reply.cimError);
    keep("Retry-After", reply.retryAfter);
    return count;
}

/// @param isEncrypted  whether the request was
std::string adviceFor(CURLcode code, bool isEncrypted) {
    switch (code) {
        case CURLE_PEER_FAILED_VERIFICATION:
            return "Name the server's certificate, or the one that signed it, with --cacert.";
        case CURLE_SSL_CACERT_BADFILE:
            return "Name a readable file with PEM certificates with --cacert.";
        case CURLE_COULDNT_CONNECT:
        case CURLE_COULDNT_RESOLVE_HOST:
        case CURLE_OPERATION_TIMEDOUT:
            return "Check that the server runs and that --server names its host and port.";
        case CURLE_GOT_NOTHING:
        case CURLE_RECV_ERROR:
            if (!isEncrypted) return "The port may be one for HTTPS: try https:// in --server.";
            [[fallthrough]];
        default:
            return "Check --server.";
    }
}

/// A list of headers as the library wants it.
class HeaderList {
  public:
    explicit HeaderList(const std::vector<std::string>& headers) {
        for (const std::string& one : headers)
            list_ = curl_slist_append(list_, one.c_str());
    }
    ~HeaderList() { curl_slist_free_all(list_); }
    HeaderList(const HeaderList&) = delete;
    HeaderList& operator=(const HeaderList&) = delete;
    curl_slist* get() const { return list_; }

  private:
    curl_slist* list_ = nullptr;
};

}  // namespace

struct HttpClient::Handle {
    CURL* curl = curl_easy_init();
    char error[CURL_ERROR_SIZE] = {};

    Handle() = default;
    Handle(const Handle&) = delete;
    Handle& operator=(const Handle&) = delete;
    ~Handle() { curl_easy_cleanup(curl); }

    template <class T>
    void set(CURLoption option, T value) {
        curl_easy_setopt(curl, option, value);
    }
};

HttpClient::HttpClient(const ServerUrl& url, const ServerSettings& settings)
    : handle_(std::make_unique<Handle>()), url_(url.text()), namesCaFile_(!settings.caFile.empty()) {
    if (handle_->curl == nullptr) {
        throw Failure(ExitStatus::Failed, "Cannot start the HTTP library.",
                      "Free some memory and try again.");
    }
    handle_->set(CURLOPT_ERRORBUFFER, handle_->error);
    handle_->set(CURLOPT_URL, url_.c_str());
    handle_->set(CURLOPT_PROTOCOLS_STR, "http,https");
    handle_->set(CURLOPT_NOSIGNAL, 1L);
    handle_->set(CURLOPT_CONNECTTIMEOUT, CONNECT_SECONDS);
    handle_->set(CURLOPT_TIMEOUT, ANSWER_SECONDS);
    handle_->set(CURLOPT_WRITEFUNCTION, &takeBody);
    handle_->set(CURLOPT_HEADERFUNCTION, &takeHeader);
    handle_->set(CURLOPT_HTTPAUTH, CURLAUTH_BASIC);
    handle_->set(CURLOPT_USERNAME, settings.user.c_str());
    handle_->set(CURLOPT_PASSWORD, settings.password.c_str());
    // A proxy would take 127.0.0.1 for itself, and get the password.
    if (url.isLoopback()) handle_->set(CURLOPT_NOPROXY, "*");
    if (namesCaFile_) handle_->set(CURLOPT_CAINFO, settings.caFile.c_str());
    if (settings.insecure) {
        handle_->set(CURLOPT_SSL_VERIFYPEER, 0L);
        handle_->set(CURLOPT_SSL_VERIFYHOST, 0L);
    }
}

HttpClient::~HttpClient() = default;

HttpReply HttpClient::post(const std::vector<std::string>& headers, const std::string& body) {
    HttpReply reply;
    const HeaderList list(headers);
    handle_->set(CURLOPT_HTTPHEADER, list.get());
    handle_->set(CURLOPT_POSTFIELDS, body.c_str());
    handle_->set(CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(body.size()));
    handle_->set(CURLOPT_WRITEDATA, &reply);
    handle_->set(CURLOPT_HEADERDATA, &reply);
    handle_->error[0] = '\0';
    CURLcode code = curl_easy_perform(handle_->curl);
    // Without a file of its own, and without those that the system may have, nobody is trusted.
    if (code == CURLE_SSL_CACERT_BADFILE && !namesCaFile_) code = CURLE_PEER_FAILED_VERIFICATION;
    if (code != CURLE_OK) {
        const char* reason = handle_->error[0] == '\0' ? curl_easy_strerror(code) : handle_->error;
        const auto status = code == CURLE_SSL_CACERT_BADFILE ? ExitStatus::WrongUse : ExitStatus::Failed;
        throw Failure(status, "The request to " + url_ + " failed: " + reason + ".",
                      adviceFor(code, url_.starts_with("https:")));
    }
    curl_easy_getinfo(handle_->curl, CURLINFO_RESPONSE_CODE, &reply.status);
    return reply;
}

}  // namespace cli
