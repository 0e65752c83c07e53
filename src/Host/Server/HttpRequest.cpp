// SPDX-License-Identifier: Apache-2.0
#include "Host/Server/HttpRequest.h"

#include <poll.h>
#include <sys/socket.h>

#include <algorithm>
#include <array>
#include <bitset>

#include "CimXml/Response.h"
#include "Framework/Requests/Audit.h"
#include "Host/Authentication/Authentication.h"
#include "Host/Authentication/ClientAddress.h"
#include "Host/Control/Control.h"
#include "Host/Operations/Dispatcher.h"
#include "Host/Server/AnswerBody.h"
#include "Host/Server/ConnectionWatch.h"
#include "Host/Server/HttpServer.h"
#include "Host/Server/LocalSocket.h"
#include "Utils/Log.h"
#include "Utils/Utils.h"

namespace host {

namespace {

constexpr const char* kRealm = "Basic realm=\"Quenx management\", charset=\"UTF-8\"";

using Text = std::optional<std::string>;

template <Text HttpHead::*Place>
void keep(HttpHead& head, const char* value) {
    head.*Place = value;
}
template <Text cimxml::RequestHeaders::*Place>
void keep(HttpHead& head, const char* value) {
    head.cim.*Place = value;
}

/// A header that is used.
struct KnownHeader {
    std::string_view name;
    /// Those decide for whom, by whom and what is asked; others may come in several parts, and the first
    /// counts.
    bool isSingle;
    void (*keep)(HttpHead& head, const char* value);
};

constexpr std::array kKnownHeaders{
    KnownHeader{"Host", true, [](HttpHead& head, const char* value) { head.host = value; }},
    KnownHeader{"Authorization", true, keep<&HttpHead::authorization>},
    KnownHeader{"Content-Type", true, keep<&HttpHead::contentType>},
    KnownHeader{"Content-Encoding", true, keep<&HttpHead::contentEncoding>},
    KnownHeader{"CIMOperation", true, keep<&cimxml::RequestHeaders::operation>},
    KnownHeader{"CIMMethod", true, keep<&cimxml::RequestHeaders::method>},
    KnownHeader{"CIMObject", true, keep<&cimxml::RequestHeaders::object>},
    KnownHeader{control::kSumHeader, true, keep<&HttpHead::sum>},
    KnownHeader{"CIMProtocolVersion", false, keep<&cimxml::RequestHeaders::protocolVersion>},
    KnownHeader{"CIMBatch", false, [](HttpHead& head, const char*) { head.cim.batch = true; }},
    KnownHeader{"Transfer-Encoding", false, [](HttpHead& head, const char*) { head.isChunked = true; }}};

/// Which of them have been seen.
struct HeaderSurvey {
    HttpHead& head;
    std::bitset<kKnownHeaders.size()> seen;
};

MHD_Result lookAtHeader(void* to, MHD_ValueKind, const char* text, const char* value) {
    auto& [head, seen] = *static_cast<HeaderSurvey*>(to);
    const std::string_view name = text;
    // "Content-Length : 5" is a length to some readers and to others none (RFC 9112 5.1).
    if (name.find_first_of(" \t") != std::string_view::npos) head.isAmbiguous = true;
    if (core::sameName(name, "Content-Length"))
        head.contentLengths.emplace_back(value == nullptr ? "" : value);
    for (std::size_t i = 0; i < kKnownHeaders.size(); ++i) {
        if (!core::sameName(name, kKnownHeaders[i].name)) continue;
        if (!seen[i] && value != nullptr) kKnownHeaders[i].keep(head, value);
        if (seen[i] && kKnownHeaders[i].isSingle) head.isAmbiguous = true;
        seen.set(i);
    }
    return MHD_YES;
}

HttpHead readHead(MHD_Connection* connection, const char* method, const char* path) {
    HttpHead head;
    head.method = method;
    head.path = path;
    head.address = addressOf(connection);
    HeaderSurvey survey{head, {}};
    ::MHD_get_connection_values(connection, MHD_HEADER_KIND, &lookAtHeader, &survey);
    return head;
}

/// A 503 in place of a 401 for one who has to wait: clients take a 401 for a wrong password and ask for
/// another.
HttpAnswer answerOf(AuthenticationOutcome outcome) {
    switch (outcome) {
        case AuthenticationOutcome::Forbidden:
            return HttpAnswer::plain(403);
        case AuthenticationOutcome::Busy:
            return HttpAnswer::withHeader(503, "Retry-After", "10");
        default:
            return HttpAnswer::withHeader(401, "WWW-Authenticate", kRealm);
    }
}

}  // namespace

void HttpAnswer::tellReason(core::ReasonId reason) {
    if (reason != core::ReasonId::None)
        headers.emplace_back(control::kReasonHeader, core::reasonCode(reason));
}

std::string addressOf(MHD_Connection* connection) {
    const MHD_ConnectionInfo* info =
        ::MHD_get_connection_info(connection, MHD_CONNECTION_INFO_CLIENT_ADDRESS);
    return info == nullptr || info->client_addr == nullptr ? "unknown" : addressText(*info->client_addr);
}

HttpRequest::HttpRequest(HttpServer& server, MHD_Connection* connection, const char* method, const char* path)
    : m_server(server),
      m_connection(connection),
      m_socket(::MHD_get_connection_info(connection, MHD_CONNECTION_INFO_CONNECTION_FD)->connect_fd),
      m_head(readHead(connection, method, path)) {
    ++m_server.m_inFlight;
}

HttpRequest::~HttpRequest() {
    --m_server.m_inFlight;
}

bool HttpRequest::isBodySmall() const {
    const auto length = contentLengthOf(m_head);
    return !m_head.isChunked && length && *length <= m_server.m_limits.anonymousBodyBytes;
}

bool HttpRequest::isLocal() const {
    return m_head.address == kLocalAddress;
}

bool HttpRequest::isControl() const {
    return m_server.m_control != nullptr && Control::serves(m_head.path);
}

std::optional<HttpAnswer> HttpRequest::checkHead() const {
    return isControl() ? Control::checkHead(m_head) : host::checkHead(m_head, m_server.m_limits.bodyBytes);
}

std::optional<HttpAnswer> HttpRequest::authenticate() {
    if (isLocal()) {
        const std::optional<User> user = localUserAt(m_socket);
        if (!user) {
            core::audit({{.address = m_head.address}, "login", "", "denied: not root"});
            return HttpAnswer::plain(403);
        }
        m_user = *user;
    } else {
        // While we wait for a turn or check a password, the client is not the slow one.
        const std::stop_token ended = m_server.m_watch->suspend(m_socket);
        AuthenticationResult result =
            m_server.m_authentication.authenticate(m_head.authorization, m_head.address, ended);
        if (result.outcome != AuthenticationOutcome::Accepted) return answerOf(result.outcome);
        m_user = std::move(result.user);
    }
    m_server.m_watch->loggedIn(m_socket, m_user.name);
    return std::nullopt;
}

std::string HttpRequest::quotaName() const {
    // Root on the spot has places of his own; no user of the network has a colon in his name.
    return isLocal() ? "unix:" + m_user.name : m_user.name;
}

Caller HttpRequest::caller() const {
    // Paths in the answer carry the name by which the client reached us, since it may come back with them.
    return {m_user.name, m_user.isAdministrator, m_head.host.empty() ? "localhost" : m_head.host,
            m_head.address};
}

std::optional<HttpAnswer> HttpRequest::openCall() {
    m_call = std::make_unique<ControlCall>(*m_server.m_control, m_head, caller());
    return m_call->isRefused() ? std::optional(m_call->finish()) : std::nullopt;
}

std::optional<HttpAnswer> HttpRequest::chargeBody() {
    m_bodyCharge.emplace(m_server.m_dispatcher.charge(quotaName()));
    try {
        m_bodyCharge->set(*contentLengthOf(m_head));
    } catch (const OverBudget&) {
        return HttpAnswer::withHeader(503, "Retry-After", "10");
    }
    return std::nullopt;
}

void HttpRequest::goOn() {
    m_server.m_watch->allow(m_socket, m_server.m_limits.requestTime);
    // The library has gone on counting how long nothing moved. It counts anew from where there was no limit.
    for (const unsigned int seconds : {0U, static_cast<unsigned int>(m_server.m_limits.idleTime.count())})
        ::MHD_set_connection_option(m_connection, MHD_CONNECTION_OPTION_TIMEOUT, seconds);
}

MHD_Result HttpRequest::begin() {
    // If a client may not send its body, it is told before it sends a megabyte.
    m_refusal = checkHead();
    if (!m_refusal) m_refusal = authenticate();
    if (!m_refusal) m_refusal = isControl() ? openCall() : chargeBody();
    // A user who has been removed must not keep his place by requests that are refused.
    if (m_refusal) m_server.m_watch->loggedOut(m_socket);
    goOn();
    if (m_call && !m_refusal) return MHD_YES;
    if (!m_refusal) {
        // If a client announces a large body and sends none, only this much memory is wasted.
        m_body.reserve(std::min<std::size_t>(*contentLengthOf(m_head), std::size_t{1} << 16));
        return MHD_YES;
    }
    // After a small body, read and dropped, the connection can go on. A large one is not worth reading: the
    // answer goes out first.
    if (isBodySmall()) return MHD_YES;
    m_mustDrain = true;
    return queue(std::move(*m_refusal));
}

void HttpRequest::take(const char* data, std::size_t size) {
    // If the request was refused, the library still hands over its body, which is dropped.
    if (m_refusal) return;
    if (!m_call) {
        m_body.append(data, size);
        return;
    }
    m_call->take(data, size);
    // An image may be on its way for long. This much of it has to come in the time for a body.
    constexpr std::size_t kTimed = std::size_t{64} << 10;
    m_untimed += size;
    if (m_untimed < kTimed) return;
    m_untimed = 0;
    m_server.m_watch->allow(m_socket, m_server.m_limits.requestTime);
}

HttpAnswer HttpRequest::carryOut() {
    // From here on the time is ours: an operation may read an image of many megabytes.
    const std::stop_token ended = m_server.m_watch->suspend(m_socket);
    const std::string user = quotaName();
    const HeldUserSlot own(m_server.m_userSlots, user, m_server.m_limits.requestTime, ended);
    if (!own) return HttpAnswer::withHeader(503, "Retry-After", "10");
    Slots& workers = isLocal() ? m_server.m_localWorkers : m_server.m_workers;
    const HeldSlot worker(workers, m_server.m_limits.requestTime, ended);
    if (!worker) return HttpAnswer::withHeader(503, "Retry-After", "10");
    return m_call ? m_call->finish() : dispatch(m_server.m_dispatcher.charge(user));
}

HttpAnswer HttpRequest::dispatch(AnswerCharge charge) {
    try {
        const cimxml::Request request = cimxml::readRequest(m_body);
        std::string().swap(m_body);
        m_bodyCharge.reset();
        cimxml::checkHeadersAgainst(m_head.cim, request);
        QUENX_DEBUG("%s of %s from %s", utils::escapeForFormat(request.name()).c_str(),
                    utils::escapeForFormat(m_user.name).c_str(), m_head.address.c_str());
        const core::NotedCall noted;
        HttpAnswer answer{
            200,
            {{"Content-Type", "application/xml; charset=\"utf-8\""}, {"CIMOperation", "MethodResponse"}},
            m_server.m_dispatcher.answer(request, caller(), charge)};
        answer.tellReason(noted.notes().reason);
        charge.set(cimxml::sizeOf(answer.body));
        answer.charge.emplace(std::move(charge));
        return answer;
    } catch (const OverBudget&) {
        return HttpAnswer::withHeader(503, "Retry-After", "10");
    } catch (const cimxml::WireError& error) {
        QUENX_DEBUG("refused a request from %s: %s", m_head.address.c_str(),
                    utils::escapeForFormat(error.what()).c_str());
        return HttpAnswer::refusal(error);
    }
}

MHD_Result HttpRequest::finish() {
    return queue(m_refusal ? std::move(*m_refusal) : carryOut());
}

MHD_Result HttpRequest::queue(HttpAnswer answer) {
    const unsigned int status = answer.status;
    MHD_Response* response = makeResponse(answer);
    if (response == nullptr) return MHD_NO;
    for (const auto& [name, value] : answer.headers) {
        ::MHD_add_response_header(response, name.c_str(), value.c_str());
    }
    if (m_mustDrain || m_server.m_stopping.load()) ::MHD_add_response_header(response, "Connection", "close");
    goOn();
    const MHD_Result result = ::MHD_queue_response(m_connection, status, response);
    ::MHD_destroy_response(response);
    return result;
}

void HttpRequest::drain() {
    if (!m_mustDrain) return;
    // Closing a socket with unread bytes resets the connection, and the reset may overtake the answer.
    ::shutdown(m_socket, SHUT_WR);
    constexpr int kPatience = 200;  // milliseconds without a byte
    constexpr int kRounds = 64;     // a megabyte, then the client has had its chance
    std::array<char, 16384> bytes{};
    for (int round = 0; round < kRounds; ++round) {
        pollfd waiting{m_socket, POLLIN, 0};
        if (::poll(&waiting, 1, kPatience) <= 0) return;
        if (::recv(m_socket, bytes.data(), bytes.size(), MSG_DONTWAIT) <= 0) return;
    }
}

}  // namespace host
