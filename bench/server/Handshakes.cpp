// SPDX-License-Identifier: Apache-2.0
// What clients get from an HTTPS server that connect anew for each request: with a whole handshake each time,
// and with the session of the connection before.
//
//   HandshakeBench PORT BODY CREDENTIALS SECONDS
//
// BODY is a file with a CIM-XML message, CREDENTIALS are base64. Checks no certificate.
#include <arpa/inet.h>
#include <gnutls/gnutls.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>
#include <string>
#include <thread>
#include <vector>

namespace {

constexpr int kClients = 4;

struct Load {
    std::uint16_t port = 0;
    std::string request;
    std::string priorities;
    bool resumes = false;
};

struct Count {
    std::atomic<unsigned int> answered{0};
    std::atomic<unsigned int> resumed{0};
    std::atomic<unsigned int> failed{0};
};

/// One client, from one connection to the next.
class Client {
  public:
    explicit Client(const Load& load) : m_load(load) { gnutls_certificate_allocate_credentials(&m_trust); }
    ~Client() {
        gnutls_free(m_kept.data);
        gnutls_certificate_free_credentials(m_trust);
    }
    Client(const Client&) = delete;
    Client& operator=(const Client&) = delete;

    void ask(Count& count) {
        const int socket = connectTo(m_load.port);
        gnutls_session_t session = nullptr;
        gnutls_init(&session, GNUTLS_CLIENT);
        gnutls_priority_set_direct(session, m_load.priorities.c_str(), nullptr);
        gnutls_credentials_set(session, GNUTLS_CRD_CERTIFICATE, m_trust);
        if (m_kept.data != nullptr) gnutls_session_set_data(session, m_kept.data, m_kept.size);
        gnutls_transport_set_int(session, socket);
        const bool isAnswered = gnutls_handshake(session) == GNUTLS_E_SUCCESS && isServed(session);
        ++(isAnswered ? count.answered : count.failed);
        if (gnutls_session_is_resumed(session) != 0) ++count.resumed;
        // With TLS 1.3 the ticket comes behind the handshake, so here it has been read.
        gnutls_free(m_kept.data);
        m_kept = {};
        if (m_load.resumes && isAnswered) gnutls_session_get_data2(session, &m_kept);
        gnutls_deinit(session);
        ::close(socket);
    }

  private:
    static int connectTo(std::uint16_t port) {
        const int socket = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
        // As usual for clients: the request must not wait until the end of the handshake is acknowledged.
        const int yes = 1;
        ::setsockopt(socket, IPPROTO_TCP, TCP_NODELAY, &yes, sizeof yes);
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_port = htons(port);
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        if (::connect(socket, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0)
            std::perror("HandshakeBench: connect");
        return socket;
    }

    bool isServed(gnutls_session_t session) const {
        if (gnutls_record_send(session, m_load.request.data(), m_load.request.size()) < 0) return false;
        std::string answer;
        std::array<char, 16384> bytes{};
        for (;;) {
            const ssize_t length = gnutls_record_recv(session, bytes.data(), bytes.size());
            if (length == GNUTLS_E_AGAIN || length == GNUTLS_E_INTERRUPTED) continue;
            if (length <= 0) return answer.starts_with("HTTP/1.1 200") && answer.ends_with("</CIM>\n");
            answer.append(bytes.data(), static_cast<std::size_t>(length));
        }
    }

    const Load& m_load;
    gnutls_certificate_credentials_t m_trust = nullptr;
    gnutls_datum_t m_kept{};
};

void measure(const char* label, const Load& load, std::chrono::seconds length) {
    Count count;
    {
        std::vector<std::jthread> clients;
        const auto end = std::chrono::steady_clock::now() + length;
        for (int i = 0; i < kClients; ++i) {
            clients.emplace_back([&] {
                Client client(load);
                while (std::chrono::steady_clock::now() < end)
                    client.ask(count);
            });
        }
    }
    std::printf("%s: %.0f requests/s, %u of %u resumed, %u errors\n", label,
                count.answered / static_cast<double>(length.count()), count.resumed.load(),
                count.answered.load(), count.failed.load());
}

}  // namespace

int main(int argc, char** argv) {
    if (argc != 5) {
        std::fprintf(stderr, "Use: HandshakeBench PORT BODY CREDENTIALS SECONDS\n");
        return 2;
    }
    std::ostringstream body;
    body << std::ifstream(argv[2]).rdbuf();
    const std::string request =
        "POST /cimom HTTP/1.1\r\nHost: localhost\r\nContent-Type: application/xml\r\nConnection: close\r\n"
        "CIMOperation: MethodCall\r\nAuthorization: Basic " +
        std::string(argv[3]) + "\r\nContent-Length: " + std::to_string(body.str().size()) + "\r\n\r\n" +
        body.str();
    for (const char* version : {"1.2", "1.3"}) {
        for (const bool resumes : {false, true}) {
            const Load load{static_cast<std::uint16_t>(std::atoi(argv[1])), request,
                            std::string("NORMAL:-VERS-ALL:+VERS-TLS") + version, resumes};
            const std::string label =
                std::string("TLS ") + version + (resumes ? ", session kept" : ", whole handshake");
            measure(label.c_str(), load, std::chrono::seconds(std::atoi(argv[4])));
        }
    }
    return 0;
}
