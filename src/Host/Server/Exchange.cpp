#include "Host/Server/Exchange.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>

#include <algorithm>
#include <array>

#include "Host/Server/CimHandler.h"
#include "Host/Server/RequestGate.h"
#include "Utils/Log.h"

namespace host {

namespace {

constexpr const char* kRealm = "Basic realm=\"Quenx management\", charset=\"UTF-8\"";

std::string addressOf(MHD_Connection* connection) {
    const MHD_ConnectionInfo* info =
        ::MHD_get_connection_info(connection, MHD_CONNECTION_INFO_CLIENT_ADDRESS);
    if (info == nullptr || info->client_addr == nullptr) return "unknown";
    std::array<char, INET6_ADDRSTRLEN> text{};
    const void* bytes =
        info->client_addr->sa_family == AF_INET6
            ? static_cast<const void*>(&reinterpret_cast<const sockaddr_in6*>(info->client_addr)->sin6_addr)
            : static_cast<const void*>(&reinterpret_cast<const sockaddr_in*>(info->client_addr)->sin_addr);
    ::inet_ntop(info->client_addr->sa_family, bytes, text.data(), static_cast<socklen_t>(text.size()));
    return text.data();
}

HttpHead readHead(MHD_Connection* connection, const char* method) {
    const auto header = [&](const char* name) -> std::optional<std::string> {
        const char* value = ::MHD_lookup_connection_value(connection, MHD_HEADER_KIND, name);
        return value == nullptr ? std::nullopt : std::optional<std::string>(value);
    };
    HttpHead head;
    head.method = method;
    head.address = addressOf(connection);
    head.host = header("Host").value_or("");
    head.authorization = header("Authorization");
    head.contentType = header("Content-Type");
    head.contentLength = header("Content-Length");
    head.chunked = header("Transfer-Encoding").has_value();
    head.cim = {header("CIMOperation"), header("CIMMethod"), std::nullopt, header("CIMProtocolVersion"),
                header("CIMBatch").has_value()};
    return head;
}

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

void freeBody(void* body) {
    delete static_cast<std::string*>(body);
}

/// The response takes the body over without copying it.
MHD_Response* makeResponse(HttpAnswer& answer) {
    auto body = std::make_unique<std::string>(std::move(answer.body));
    std::string& text = *body;
    MHD_Response* response = ::MHD_create_response_from_buffer_with_free_callback_cls(
        text.size(), text.data(), freeBody, body.get());
    if (response != nullptr) body.release();
    return response;
}

}  // namespace

Exchange::Exchange(HttpServer& server, MHD_Connection* connection, const char* method)
    : m_server(server),
      m_connection(connection),
      m_socket(::MHD_get_connection_info(connection, MHD_CONNECTION_INFO_CONNECTION_FD)->connect_fd),
      m_head(readHead(connection, method)) {
    ++m_server.m_inFlight;
}

Exchange::~Exchange() {
    --m_server.m_inFlight;
}

bool Exchange::isBodySmall() const {
    const auto length = contentLengthOf(m_head);
    return !m_head.chunked && length && *length <= m_server.m_limits.anonymousBodyBytes;
}

std::optional<HttpAnswer> Exchange::authenticate() {
    // Waiting for a turn or a password check is the server's affair, not the client's slowness.
    m_server.m_watch->suspend(m_socket);
    AuthenticationResult result =
        m_server.m_authentication.authenticate(m_head.authorization, m_head.address);
    if (result.outcome != AuthenticationOutcome::Accepted) return answerOf(result.outcome);
    m_identity = std::move(result.identity);
    return std::nullopt;
}

std::optional<HttpAnswer> Exchange::refusal() {
    std::optional<HttpAnswer> answer = refuseByHead(m_head, m_server.m_limits.bodyBytes);
    return answer ? answer : authenticate();
}

MHD_Result Exchange::begin() {
    m_refusal = refusal();
    m_server.m_watch->allow(m_socket, m_server.m_limits.requestTime);
    if (!m_refusal) {
        m_body.reserve(std::min<std::size_t>(*contentLengthOf(m_head), std::size_t{1} << 16));
        return MHD_YES;
    }
    // A small body is read and dropped, and the connection can go on; before a large one, the answer.
    if (isBodySmall()) return MHD_YES;
    m_mustDrain = true;
    return queue(std::move(*m_refusal));
}

void Exchange::take(const char* data, std::size_t size) {
    if (!m_refusal) m_body.append(data, size);
}

HttpAnswer Exchange::carryOut() {
    m_server.m_watch->suspend(m_socket);
    const Slots::Use worker(m_server.m_workers, m_server.m_limits.requestTime);
    if (!worker) return HttpAnswer::withHeader(503, "Retry-After", "10");
    return answerBody(m_server.m_dispatcher, m_head, m_identity, m_body);
}

MHD_Result Exchange::finish() {
    return queue(m_refusal ? std::move(*m_refusal) : carryOut());
}

MHD_Result Exchange::queue(HttpAnswer answer) {
    const unsigned int status = answer.status;
    MHD_Response* response = makeResponse(answer);
    if (response == nullptr) return MHD_NO;
    for (const auto& [name, value] : answer.headers) {
        ::MHD_add_response_header(response, name.c_str(), value.c_str());
    }
    if (m_mustDrain || m_server.m_stopping.load()) ::MHD_add_response_header(response, "Connection", "close");
    m_server.m_watch->allow(m_socket, m_server.m_limits.requestTime);
    const MHD_Result result = ::MHD_queue_response(m_connection, status, response);
    ::MHD_destroy_response(response);
    return result;
}

void Exchange::drain() {
    if (!m_mustDrain) return;
    ::shutdown(m_socket, SHUT_WR);
    constexpr int kPatience = 200;  // milliseconds without a byte
    constexpr int kRounds = 64;
    std::array<char, 16384> bytes{};
    for (int round = 0; round < kRounds; ++round) {
        pollfd waiting{m_socket, POLLIN, 0};
        if (::poll(&waiting, 1, kPatience) <= 0) return;
        if (::recv(m_socket, bytes.data(), bytes.size(), MSG_DONTWAIT) <= 0) return;
    }
}

}  // namespace host
