// SPDX-License-Identifier: Apache-2.0
#include "Indications/StrictListener.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <map>
#include <sstream>

#include "Framework/Model/CimType.h"

namespace test {

namespace {

/// The head of a request, and as much of its body as its length says.
struct HttpMessage {
    std::string requestLine;
    std::map<std::string, std::string> headers;  ///< by folded name
    std::string body;

    std::string header(const std::string& name) const {
        const auto found = headers.find(core::foldName(name));
        return found == headers.end() ? "(none)" : found->second;
    }
};

template <class Channel>
HttpMessage readMessage(Channel& channel) {
    std::string bytes;
    std::array<char, 4096> buffer{};
    std::size_t whole = std::string::npos;
    HttpMessage message;
    while (bytes.size() < whole) {
        const ssize_t count = channel.receive(buffer.data(), buffer.size());
        if (count <= 0) return {};
        bytes.append(buffer.data(), static_cast<std::size_t>(count));
        const std::size_t end = bytes.find("\r\n\r\n");
        if (end == std::string::npos || whole != std::string::npos) continue;
        std::istringstream head(bytes.substr(0, end));
        std::getline(head, message.requestLine, '\r');
        for (std::string line; head.get() == '\n' && std::getline(head, line, '\r');)
            message.headers[core::foldName(line.substr(0, line.find(':')))] =
                line.substr(line.find(": ") + 2);
        whole = end + 4 + std::stoul("0" + message.header("Content-Length").substr(0, 9));
        if (message.header("Content-Length") == "(none)") return message;
    }
    message.body = bytes.substr(bytes.find("\r\n\r\n") + 4);
    return message;
}

/// All that some listener insists on.
std::string problemOf(const HttpMessage& message) {
    const std::array<std::array<const char*, 2>, 10> kExpected = {
        {{"Content-Type", "application/xml; charset=utf-8"},
         {"CIMExport", "MethodRequest"},
         {"CIMExportMethod", "ExportIndication"},
         {"CIMProtocolVersion", "1.0"},
         {"Accept", "*/*"},
         {"Transfer-Encoding", "(none)"},
         {"Content-Encoding", "(none)"},
         {"Expect", "(none)"},
         {"Authorization", "(none)"},
         {"Proxy-Connection", "(none)"}}};
    for (const auto& [name, value] : kExpected)
        if (message.header(name) != value) return std::string(name) + ": " + message.header(name);
    if (!message.requestLine.starts_with("POST /") || !message.requestLine.ends_with(" HTTP/1.1"))
        return message.requestLine;
    if (message.header("Host") == "(none)") return "no Host";
    return "";
}

std::string idIn(const std::string& body) {
    const std::size_t begin = body.find("ID=\"") + 4;
    return body.substr(begin, body.find('"', begin) - begin);
}

std::string answered(const std::string& id, const std::string& content) {
    return "<?xml version=\"1.0\" encoding=\"utf-8\" ?><CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.4\"><MESSAGE "
           "ID=\"" +
           id + "\" PROTOCOLVERSION=\"1.4\"><SIMPLEEXPRSP><EXPMETHODRESPONSE NAME=\"ExportIndication\">" +
           content + "</EXPMETHODRESPONSE></SIMPLEEXPRSP></MESSAGE></CIM>";
}

}  // namespace

/// A connection, with TLS or without.
class StrictListener::Channel {
  public:
    Channel(int connection, gnutls_certificate_credentials_t credentials) : m_connection(connection) {
        if (credentials == nullptr) return;
        ::gnutls_init(&m_session, GNUTLS_SERVER | GNUTLS_NO_SIGNAL);
        ::gnutls_set_default_priority(m_session);
        ::gnutls_credentials_set(m_session, GNUTLS_CRD_CERTIFICATE, credentials);
        ::gnutls_transport_set_int(m_session, connection);
        ::gnutls_handshake_set_timeout(m_session, 5000);
        m_isOpen = ::gnutls_handshake(m_session) == GNUTLS_E_SUCCESS;
    }
    Channel(const Channel&) = delete;
    Channel& operator=(const Channel&) = delete;
    ~Channel() {
        if (m_session != nullptr) ::gnutls_deinit(m_session);
        ::close(m_connection);
    }

    ssize_t receive(char* bytes, std::size_t most) {
        if (!m_isOpen) return 0;
        return m_session == nullptr ? ::recv(m_connection, bytes, most, 0)
                                    : ::gnutls_record_recv(m_session, bytes, most);
    }
    void send(const std::string& text) {
        for (std::size_t sent = 0; sent < text.size();) {
            const char* const rest = text.data() + sent;
            const ssize_t count = m_session == nullptr
                                      ? ::send(m_connection, rest, text.size() - sent, MSG_NOSIGNAL)
                                      : ::gnutls_record_send(m_session, rest, text.size() - sent);
            if (count <= 0) return;
            sent += static_cast<std::size_t>(count);
        }
    }
    void resetAtEnd() {
        const linger reset{1, 0};
        ::setsockopt(m_connection, SOL_SOCKET, SO_LINGER, &reset, sizeof reset);
    }

  private:
    const int m_connection;
    gnutls_session_t m_session = nullptr;
    bool m_isOpen = true;
};

StrictListener::StrictListener(std::function<Step(std::size_t)> script, const std::string& pem)
    : m_script(std::move(script)), m_socket(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    if (!pem.empty()) {
        ::gnutls_certificate_allocate_credentials(&m_credentials);
        const int status = ::gnutls_certificate_set_x509_key_file(m_credentials, pem.c_str(), pem.c_str(),
                                                                  GNUTLS_X509_FMT_PEM);
        if (status < 0) throw std::runtime_error(::gnutls_strerror(status));
    }
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t length = sizeof address;
    auto* const any = reinterpret_cast<sockaddr*>(&address);
    if (::bind(m_socket, any, length) != 0 || ::listen(m_socket, 128) != 0)
        throw std::runtime_error("no port");
    ::getsockname(m_socket, any, &length);
    m_port = ntohs(address.sin_port);
    m_accepting = std::jthread([this] { accept(); });
}

StrictListener::~StrictListener() {
    {
        const std::lock_guard lock(m_mutex);
        m_isEnding = true;
        m_changed.notify_all();
    }
    ::shutdown(m_socket, SHUT_RDWR);
    m_accepting.join();
    m_serving.clear();
    ::close(m_socket);
    if (m_credentials != nullptr) ::gnutls_certificate_free_credentials(m_credentials);
}

void StrictListener::accept() {
    while (true) {
        const int connection = ::accept4(m_socket, nullptr, nullptr, SOCK_CLOEXEC);
        if (connection < 0) return;
        std::erase_if(m_serving, [](const std::future<void>& each) {
            return each.wait_for(std::chrono::seconds(0)) == std::future_status::ready;
        });
        m_serving.push_back(std::async(std::launch::async, [this, connection] { serve(connection); }));
    }
}

void StrictListener::serve(int connection) {
    Channel channel(connection, m_credentials);
    const HttpMessage message = readMessage(channel);
    if (message.requestLine.empty()) return;
    std::size_t number = 0;
    {
        const std::lock_guard lock(m_mutex);
        number = m_bodies.size();
        m_bodies.push_back(message.body);
        const std::string problem = problemOf(message);
        if (!problem.empty()) m_problems.push_back(problem);
    }
    answer(channel, m_script(number), message.body);
    m_changed.notify_all();
}

void StrictListener::answer(Channel& channel, const Step& step, const std::string& body) {
    std::string content;
    std::string headers = "CIMExport: MethodResponse\r\nContent-Type: text/xml; charset=utf-8\r\n";
    switch (step.answer) {
        case Answer::Taken:
            content = answered(idIn(body), "<IRETURNVALUE></IRETURNVALUE>");
            break;
        case Answer::Error:
            content = answered(idIn(body), "<ERROR CODE=\"1\" DESCRIPTION=\"the queue is full\"/>");
            break;
        case Answer::Nonsense:
            content = "<html>All is well.</html>";
            break;
        case Answer::Redirect:
            headers += "Location: " + url("/elsewhere") + "\r\n";
            break;
        case Answer::Endless:
            content.assign(1 << 20, 'x');
            break;
        case Answer::Nothing:
            channel.resetAtEnd();
            return;
        case Answer::Never: {
            std::unique_lock lock(m_mutex);
            m_changed.notify_all();
            m_changed.wait(lock, [this] { return m_isEnding; });
            return;
        }
    }
    channel.send("HTTP/1.1 " + std::to_string(step.status) + " Whatever\r\n" + headers +
                 "Content-Length: " + std::to_string(content.size()) + "\r\n\r\n" + content);
}

std::vector<std::string> StrictListener::waitFor(std::size_t count) {
    std::unique_lock lock(m_mutex);
    m_changed.wait_for(lock, std::chrono::seconds(60), [&] { return m_bodies.size() >= count; });
    return m_bodies;
}

std::vector<std::string> StrictListener::problems() {
    const std::lock_guard lock(m_mutex);
    return m_problems;
}

}  // namespace test
