// SPDX-License-Identifier: Apache-2.0
// Answers that no server should give.
#include <arpa/inet.h>
#include <gmock/gmock.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <cstdlib>
#include <thread>

#include "Cli/Connection/Connection.h"

namespace {

using ::testing::StrEq;
using ::testing::ThrowsMessage;

/// Answers one request on loopback, whatever it asks.
class OneAnswer {
  public:
    explicit OneAnswer(const std::string& response)
        : m_answer("<CIM CIMVERSION='2.0' DTDVERSION='2.0'>" + response + "</CIM>"),
          m_socket(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        sockaddr_in address{};
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        socklen_t size = sizeof address;
        auto* generic = reinterpret_cast<sockaddr*>(&address);
        EXPECT_EQ(::bind(m_socket, generic, size), 0);
        EXPECT_EQ(::listen(m_socket, 1), 0);
        EXPECT_EQ(::getsockname(m_socket, generic, &size), 0);
        m_port = ntohs(address.sin_port);
        m_thread = std::thread([this] { answer(); });
    }
    OneAnswer(const OneAnswer&) = delete;
    OneAnswer& operator=(const OneAnswer&) = delete;
    ~OneAnswer() {
        ::shutdown(m_socket, SHUT_RDWR);
        m_thread.join();
        ::close(m_socket);
    }

    cli::Connection connect() const {
        ::setenv("QUENXCTL_PASSWORD", "admin", 1);
        cli::ServerSettings settings;
        settings.url.emplace("http://127.0.0.1:" + std::to_string(m_port));
        settings.user = "admin";
        return cli::openServer(settings, [] { return false; });
    }

  private:
    void answer() const {
        const int client = ::accept(m_socket, nullptr, nullptr);
        std::string request;
        std::array<char, 4096> bytes{};
        while (request.find("</CIM>") == std::string::npos) {
            const ssize_t length = ::recv(client, bytes.data(), bytes.size(), 0);
            if (length <= 0) break;
            request.append(bytes.data(), static_cast<std::size_t>(length));
        }
        const std::string reply =
            "HTTP/1.1 200 OK\r\nConnection: close\r\nContent-Length: " + std::to_string(m_answer.size()) +
            "\r\n\r\n" + m_answer;
        EXPECT_EQ(::send(client, reply.data(), reply.size(), MSG_NOSIGNAL),
                  static_cast<ssize_t>(reply.size()));
        ::close(client);
    }

    const std::string m_answer;
    const int m_socket;
    int m_port = 0;
    std::thread m_thread;
};

std::string message(const std::string& id, const std::string& content) {
    return "<MESSAGE ID='" + id + "' PROTOCOLVERSION='1.0'><SIMPLERSP>" + content + "</SIMPLERSP></MESSAGE>";
}

TEST(RemoteConnectionTest, TakesNoAnswerForAnotherRequestsOrForNothing) {
    const std::string returned = "<RETURNVALUE><VALUE>0</VALUE></RETURNVALUE></METHODRESPONSE>";
    const char* const other = "The server's answer belongs to another request.";
    const auto call = [](const std::string& response) {
        OneAnswer(response).connect().operations->invokeMethod(core::CimPath("Y.Name=\"1\""), "X", {});
    };
    call(message("1", "<METHODRESPONSE NAME='x'>" + returned));
    const std::pair<std::string, const char*> table[] = {
        {message("1", "<METHODRESPONSE NAME='Z'>" + returned), other},
        {message("2", "<METHODRESPONSE NAME='X'>" + returned), other},
        {message("1", "<IMETHODRESPONSE NAME='X'/>"), "The server's answer is not that of a method."},
        {message("1", "<METHODRESPONSE NAME='X'/>"),
         "The server's answer cannot be read: element METHODRESPONSE has no RETURNVALUE."}};
    for (const auto& row : table)
        EXPECT_THAT([&] { call(row.first); }, ThrowsMessage<cli::NoAnswer>(StrEq(row.second)));
    const OneAnswer server(message("1", "<METHODRESPONSE NAME='EnumerateInstanceNames'>" + returned));
    EXPECT_THROW(server.connect().operations->enumerateInstanceNames("Y"), cli::NoAnswer);
}

std::string classBelow(const std::string& name, const std::string& superclass) {
    return "<CLASS NAME='" + name + "' SUPERCLASS='" + superclass + "'/>";
}

TEST(RemoteConnectionTest, BuildsNoEndlessChainsOfClasses) {
    const auto read = [](const std::string& classes) {
        const OneAnswer server(message("1", "<IMETHODRESPONSE NAME='EnumerateClasses'><IRETURNVALUE>" +
                                                classes + "</IRETURNVALUE></IMETHODRESPONSE>"));
        server.connect().operations->enumerateClasses("", true);
    };
    read(classBelow("A", "B") + classBelow("B", "Elsewhere"));
    std::string line;
    for (int i = 0; i < 20000; ++i)
        line += classBelow("C" + std::to_string(i), "C" + std::to_string(i + 1));
    const std::pair<std::string, const char*> table[] = {
        {classBelow("A", "a"), "class A is its own superclass"},
        {classBelow("A", "B") + classBelow("B", "C") + classBelow("C", "B"), "class B is its own superclass"},
        {line, "class C0 has too many superclasses"}};
    for (const auto& row : table)
        EXPECT_THAT([&] { read(row.first); }, ThrowsMessage<core::CimError>(StrEq(row.second)));
}

}  // namespace
