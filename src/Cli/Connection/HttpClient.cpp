// SPDX-License-Identifier: Apache-2.0
#include "Cli/Connection/HttpClient.h"

#include <arpa/inet.h>
#include <unistd.h>

#include <cstdlib>
#include <limits>
#include <string_view>

#include "CimXml/Request.h"
#include "Cli/Display/Messages.h"
#include "Control/Interface.h"
#include "Framework/Requests/NotedCall.h"
#include "Utils/Utils.h"

namespace cli {

namespace {

using control::curl;
using control::CurlLibrary;
using UrlParts = std::unique_ptr<CURLU, decltype(CurlLibrary::urlCleanup)>;

/// Who names a server needs it.
void requireCurl() try { curl(); } catch (const control::NoCurlLibrary& error) {
    throw CommandError(
        ExitStatus::Failed, "Cannot load the HTTP library: " + error.why() + ".",
        "Install the package libcurl4, or run quenxctl on the server itself, without --server.");
}

[[noreturn]] void refuseUrl(const std::string& text, const std::string& why) {
    // What stands before an @ may be a password.
    const std::string shown = text.find('@') == std::string::npos ? " \"" + text + "\"" : std::string();
    throw CommandError(ExitStatus::WrongUse, "--server" + shown + " " + why + ".",
                       "Write it as https://host:5989.");
}

/// Empty when the URL has no such part.
std::string partOf(const UrlParts& url, CURLUPart part) {
    char* text = nullptr;
    if (curl().urlGet(url.get(), part, &text, 0) != CURLUE_OK) return {};
    std::string result = text;
    curl().free(text);
    return result;
}

bool isLoopbackHost(const std::string& host) {
    in_addr address{};
    if (inet_pton(AF_INET, host.c_str(), &address) == 1) return (ntohl(address.s_addr) >> 24) == 127;
    return host == "localhost" || host == "[::1]";
}

std::size_t takeBody(char* data, std::size_t, std::size_t count, void* to) {
    auto& reply = *static_cast<HttpReply*>(to);
    // Anything but the count ends the transfer.
    reply.isTooLarge = count > kLargestAnswer - reply.body.size();
    if (reply.isTooLarge) return 0;
    reply.body.append(data, count);
    return count;
}

int stopIfInterrupted(void* isInterrupted, curl_off_t, curl_off_t, curl_off_t, curl_off_t) {
    return (*static_cast<std::function<bool()>*>(isInterrupted))() ? 1 : 0;
}

/// Asked before each attempt to send a request.
int countAttempt(void* attempts, char*, char*, int, int) {
    return --*static_cast<int*>(attempts) < 0 ? CURL_PREREQFUNC_ABORT : CURL_PREREQFUNC_OK;
}

std::size_t takeHeader(char* data, std::size_t, std::size_t count, void* to) {
    auto& reply = *static_cast<HttpReply*>(to);
    const std::string_view line(data, count);
    const std::size_t colon = line.find(':');
    if (colon == std::string_view::npos) return count;
    const auto keep = [&](std::string_view name, std::string& value) {
        if (!utils::equalsIgnoringCase(line.substr(0, colon), name)) return;
        value = std::string(utils::trimOf(line.substr(colon + 1), " \t\r\n"));
    };
    keep("CIMError", reply.cimError);
    keep("Retry-After", reply.retryAfter);
    std::string version;
    keep(control::kHeader, version);
    if (!version.empty()) reply.isControl = true;
    std::string reason;
    keep(control::kReasonHeader, reason);
    core::NotedCall::noteReason(core::parseReasonCode(reason));
    return count;
}

std::size_t giveFile(char* to, std::size_t, std::size_t most, void* descriptor) {
    const ssize_t got = ::read(*static_cast<const int*>(descriptor), to, most);
    return got < 0 ? CURL_READFUNC_ABORT : static_cast<std::size_t>(got);
}

/// "https://host:5989"
std::string rootOf(const std::string& url) {
    return url.substr(0, url.find('/', url.find("://") + 3));
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
            // A server that expects a TLS handshake hangs up on anything else.
            if (!isEncrypted) return "The port may be one for HTTPS: try https:// in --server.";
            [[fallthrough]];
        default:
            return "Check --server.";
    }
}

}  // namespace

std::string localSocket() {
    const char* chosen = std::getenv("QUENXCTL_SOCKET");
    return chosen == nullptr || *chosen == '\0' ? cimxml::kDefaultSocket : chosen;
}

void refuseLargeAnswer(const std::string& url, std::size_t limit) {
    throw NoAnswer(
        ExitStatus::Failed,
        "The answer of " + url + " is larger than " + std::to_string(limit >> 20) +
            " MiB and was not read to its end.",
        "Ask for less, such as a class further down, or check that --server names a CIM-XML server.");
}

void requireOk(const HttpReply& reply) {
    // It may be a date, too.
    const bool isInSeconds = utils::parseNumber<std::uint32_t>(reply.retryAfter).has_value();
    const std::string wait = isInSeconds ? reply.retryAfter + " seconds" : "a while";
    const std::string why = reply.cimError.empty() ? "" : " (" + reply.cimError + ")";
    switch (reply.status) {
        // CIM errors come with it, too: any other status is about the way there.
        case 200:
            return;
        case 401:
            throw LoginRefused(ExitStatus::Failed, "The server does not accept the user name and password.",
                               "Check --user or QUENXCTL_USER, and QUENXCTL_PASSWORD or what was typed.");
        case 403:
            throw LoginRefused(
                ExitStatus::Failed, "This user may not use the server.",
                "On quenx-cimd, log in as root, as a member of the group quenx-admin, or as a user whom "
                "its setting auth.readers names.");
        case 503:
            throw CommandError(
                ExitStatus::Failed,
                "The server is busy, or it blocks log-ins from this address for a while after wrong "
                "passwords.",
                "Try again in " + wait + ".");
        default:
            throw NoAnswer(ExitStatus::Failed,
                           "The server answered with HTTP status " + std::to_string(reply.status) + why + ".",
                           "Check that --server names a CIM-XML server; its log has the details.");
    }
}

ServerUrl::ServerUrl(const std::string& text) {
    constexpr std::string_view kLocal = "unix:";
    requireCurl();
    if (text.starts_with(kLocal)) {
        m_socket = text.size() == kLocal.size() ? localSocket() : text.substr(kLocal.size());
        m_text = std::string(kLocal) + m_socket;
        m_isLoopback = true;
        return;
    }
    if (text.find("://") == std::string::npos) refuseUrl(text, "does not begin with https:// or http://");
    const UrlParts url(curl().url(), curl().urlCleanup);
    // Any scheme, so that a wrong one is refused in words that say which are right.
    const CURLUcode error = curl().urlSet(url.get(), CURLUPART_URL, text.c_str(), CURLU_NON_SUPPORT_SCHEME);
    if (error != CURLUE_OK) refuseUrl(text, std::string("is not a URL: ") + curl().urlStrerror(error));
    const std::string scheme = partOf(url, CURLUPART_SCHEME);
    if (scheme != "https" && scheme != "http") refuseUrl(text, "does not begin with https:// or http://");
    if (!partOf(url, CURLUPART_USER).empty() || !partOf(url, CURLUPART_PASSWORD).empty()) {
        throw CommandError(
            ExitStatus::WrongUse, "--server holds a user name or a password.",
            "Name the user with --user, and leave the password to QUENXCTL_PASSWORD or the prompt.");
    }
    m_isEncrypted = scheme == "https";
    // The ports that are registered for CIM-XML, and not those of the scheme.
    if (partOf(url, CURLUPART_PORT).empty())
        curl().urlSet(url.get(), CURLUPART_PORT, m_isEncrypted ? "5989" : "5988", 0);
    if (partOf(url, CURLUPART_PATH) == "/") curl().urlSet(url.get(), CURLUPART_PATH, "/cimom", 0);
    m_isLoopback = isLoopbackHost(partOf(url, CURLUPART_HOST));
    m_text = partOf(url, CURLUPART_URL);
}

HttpClient::HttpClient(const ServerSettings& settings, const std::string& user, const std::string& password,
                       std::function<bool()> isInterrupted)
    : m_curl(curl().easyInit(), curl().easyCleanup),
      m_url(settings.url->text()),
      m_root(settings.url->socket().empty() ? rootOf(m_url) : "http://localhost"),
      m_isLocal(!settings.url->socket().empty()),
      m_namesCaFile(!settings.caFile.empty()),
      m_isInterrupted(std::move(isInterrupted)) {
    if (m_curl == nullptr) {
        throw CommandError(ExitStatus::Failed, "Cannot start the HTTP library.",
                           "Free some memory and try again.");
    }
    constexpr long kConnectSeconds = 15;
    set(CURLOPT_ERRORBUFFER, m_error.data());
    set(CURLOPT_URL, m_isLocal ? (m_root + "/cimom").c_str() : m_url.c_str());
    if (m_isLocal) set(CURLOPT_UNIX_SOCKET_PATH, settings.url->socket().c_str());
    set(CURLOPT_PROTOCOLS_STR, "http,https");
    set(CURLOPT_NOSIGNAL, 1L);  // signals are this program's own business
    set(CURLOPT_CONNECTTIMEOUT, kConnectSeconds);
    set(CURLOPT_WRITEFUNCTION, &takeBody);
    set(CURLOPT_MAXFILESIZE_LARGE, static_cast<curl_off_t>(kLargestAnswer));
    set(CURLOPT_HEADERFUNCTION, &takeHeader);
    set(CURLOPT_NOPROGRESS, 0L);
    set(CURLOPT_XFERINFODATA, &m_isInterrupted);
    set(CURLOPT_XFERINFOFUNCTION, &stopIfInterrupted);
    // The library repeats a request by itself when a kept connection is closed without an answer.
    set(CURLOPT_PREREQFUNCTION, &countAttempt);
    set(CURLOPT_PREREQDATA, &m_attempts);
    if (!m_isLocal) {
        // The one scheme that every WBEM server has. Naming it saves a first request that would be refused.
        set(CURLOPT_HTTPAUTH, CURLAUTH_BASIC);
        set(CURLOPT_USERNAME, user.c_str());
        set(CURLOPT_PASSWORD, password.c_str());
    }
    // A proxy would take 127.0.0.1 for itself, and get the password.
    if (settings.url->isLoopback()) set(CURLOPT_NOPROXY, "*");
    if (m_namesCaFile) set(CURLOPT_CAINFO, settings.caFile.c_str());
    if (settings.insecure) {
        set(CURLOPT_SSL_VERIFYPEER, 0L);
        set(CURLOPT_SSL_VERIFYHOST, 0L);
    }
}

HttpReply HttpClient::post(const std::vector<std::string>& headers, const std::string& body,
                           Sending sending) {
    // The body is not copied: it outlives the transfer.
    bePatient(false);
    set(CURLOPT_POSTFIELDS, body.c_str());
    set(CURLOPT_POSTFIELDSIZE_LARGE, static_cast<curl_off_t>(body.size()));
    return perform(headers, sending);
}

void HttpClient::bePatient(bool sendsFile) {
    // An answer may have to wait for the verification of a large image.
    constexpr long kAnswerSeconds = 120;
    // A file may take its time, but not stand still: at its end, too, where the server puts it onto its disk.
    constexpr long kStandstillSeconds = 120;
    set(CURLOPT_TIMEOUT, sendsFile ? 0L : kAnswerSeconds);
    set(CURLOPT_LOW_SPEED_LIMIT, sendsFile ? 1L : 0L);
    set(CURLOPT_LOW_SPEED_TIME, sendsFile ? kStandstillSeconds : 0L);
}

HttpReply HttpClient::send(const ControlRequest& request) {
    const bool sendsFile = request.file >= 0;
    bePatient(sendsFile);
    set(CURLOPT_URL, (m_root + request.path).c_str());
    set(CURLOPT_UPLOAD, sendsFile ? 1L : 0L);
    set(CURLOPT_CUSTOMREQUEST, request.method);
    if (sendsFile) {
        set(CURLOPT_READFUNCTION, &giveFile);
        set(CURLOPT_READDATA, &request.file);
        set(CURLOPT_INFILESIZE_LARGE, static_cast<curl_off_t>(request.fileBytes));
    } else if (request.body.empty()) {
        set(CURLOPT_HTTPGET, 1L);
    } else {
        return post(request.headers, request.body, Sending::Once);
    }
    return perform(request.headers, Sending::Once);
}

HttpReply HttpClient::perform(const std::vector<std::string>& headers, Sending sending) {
    HttpReply reply;
    m_attempts = sending == Sending::Once ? 1 : std::numeric_limits<int>::max();
    std::unique_ptr<curl_slist, decltype(CurlLibrary::slistFreeAll)> list(nullptr, curl().slistFreeAll);
    for (const std::string& header : headers)
        list.reset(curl().slistAppend(list.release(), header.c_str()));
    set(CURLOPT_HTTPHEADER, list.get());
    set(CURLOPT_WRITEDATA, &reply);
    set(CURLOPT_HEADERDATA, &reply);
    m_error.front() = '\0';  // the library does not clear what an earlier failure left
    const CURLcode code = curl().easyPerform(m_curl.get());
    if (code != CURLE_OK) refuse(code, reply.isTooLarge || code == CURLE_FILESIZE_EXCEEDED);
    curl().easyGetinfo(m_curl.get(), CURLINFO_RESPONSE_CODE, &reply.status);
    return reply;
}

void HttpClient::refuse(CURLcode code, bool isTooLarge) const {
    // Without --cacert it is the system that has no certificates, so the user did not name a bad file.
    if (code == CURLE_SSL_CACERT_BADFILE && !m_namesCaFile) code = CURLE_PEER_FAILED_VERIFICATION;
    long sent = 0;
    curl().easyGetinfo(m_curl.get(), CURLINFO_REQUEST_SIZE, &sent);
    if (m_attempts < 0) {
        throw NoAnswer(ExitStatus::Failed, m_url + " closed the connection without an answer.",
                       "Check the server's log, and try again.");
    }
    if (code == CURLE_ABORTED_BY_CALLBACK) {
        const std::string what = "Interrupted while waiting for the server.";
        if (sent > 0) throw NoAnswer(ExitStatus::Interrupted, what, "");
        throw CommandError(ExitStatus::Interrupted, what, "");
    }
    if (isTooLarge) refuseLargeAnswer(m_url, kLargestAnswer);
    const std::string reason = m_error.front() == '\0' ? curl().easyStrerror(code) : m_error.data();
    const std::string what = "The request to " + m_url + " failed: " + reason + ".";
    const std::string advice = m_isLocal ? "Check that quenx-cimd runs, and listens there (listen.socket)."
                                         : adviceFor(code, m_url.starts_with("https:"));
    if (sent > 0) throw NoAnswer(ExitStatus::Failed, what, advice);
    throw CommandError(code == CURLE_SSL_CACERT_BADFILE ? ExitStatus::WrongUse : ExitStatus::Failed, what,
                       advice);
}

}  // namespace cli
