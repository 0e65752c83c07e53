// SPDX-License-Identifier: Apache-2.0
// Answers that no server should give.
#include <gmock/gmock.h>

#include <array>
#include <atomic>
#include <cstdlib>
#include <functional>
#include <nlohmann/json.hpp>
#include <thread>

#include "Cli/Connection/Connection.h"
#include "Cli/Connection/ServerControl.h"
#include "Host/UnixSocket.h"
#include "Support/TempFolder.h"

namespace {

using ::testing::HasSubstr;
using ::testing::StrEq;
using ::testing::ThrowsMessage;

/// Answers requests on a socket, one on each connection, as it is told.
class ToldServer {
  public:
    /// Sends what it likes to the client's socket.
    using Answer = std::function<void(int client, const std::string& request)>;

    explicit ToldServer(Answer answer) : m_answer(std::move(answer)) {
        EXPECT_EQ(::listen(m_socket.number(), 1), 0);
        m_thread = std::jthread([this] { serve(); });
    }
    /// Answers with this response, whatever is asked.
    explicit ToldServer(const std::string& response)
        : ToldServer([response](int client, const std::string&) { sendResponse(client, response); }) {}
    ~ToldServer() { ::shutdown(m_socket.number(), SHUT_RDWR); }

    static bool sendBytes(int client, const std::string& bytes) {
        return ::send(client, bytes.data(), bytes.size(), MSG_NOSIGNAL) == static_cast<ssize_t>(bytes.size());
    }
    static void sendResponse(int client, const std::string& response) {
        const std::string body = "<CIM CIMVERSION='2.0' DTDVERSION='2.0'>" + response + "</CIM>";
        EXPECT_TRUE(sendBytes(client, "HTTP/1.1 200 OK\r\nConnection: close\r\nContent-Length: " +
                                          std::to_string(body.size()) + "\r\n\r\n" + body));
    }

    cli::Connection connect() const {
        cli::ServerSettings settings;
        settings.url.emplace("unix:" + (m_folder / "socket"));
        return cli::openServer(settings, [] { return false; });
    }

  private:
    static bool isWhole(const std::string& request) {
        constexpr std::string_view kLength = "Content-Length: ";
        const std::size_t end = request.find("\r\n\r\n");
        const std::size_t length = request.find(kLength);
        return end != std::string::npos &&
               request.size() - end - 4 >=
                   (length == std::string::npos ? 0 : std::stoul(request.substr(length + kLength.size())));
    }
    void serve() const {
        for (int number = 0; (number = ::accept(m_socket.number(), nullptr, nullptr)) >= 0;) {
            const os::Descriptor client(number);  // closed with its answer
            std::string request;
            std::array<char, 4096> bytes{};
            while (!isWhole(request)) {
                const ssize_t length = ::recv(number, bytes.data(), bytes.size(), 0);
                if (length <= 0) break;
                request.append(bytes.data(), static_cast<std::size_t>(length));
            }
            m_answer(client.number(), request);
        }
    }

    const Answer m_answer;
    const test::TempFolder m_folder;
    const test::UnixSocket m_socket{SOCK_STREAM, m_folder / "socket"};
    std::jthread m_thread;
};

TEST(ServerUrlTest, CompletesWhatIsLeftOut) {
    ::setenv("QUENXCTL_SOCKET", "", 1);
    const std::tuple<std::string, std::string, bool, bool> table[] = {
        {"https://host", "https://host:5989/cimom", true, false},
        {"https://localhost:1/x", "https://localhost:1/x", true, true},
        {"http://127.9.0.1/", "http://127.9.0.1:5988/cimom", false, true},
        {"http://128.0.0.1", "http://128.0.0.1:5988/cimom", false, false},
        {"https://[::1]", "https://[::1]:5989/cimom", true, true},
        {"unix:", "unix:/run/quenx-cimd/socket", false, true},
        {"unix:/s", "unix:/s", false, true},
    };
    for (const auto& [given, whole, isEncrypted, isLoopback] : table) {
        const cli::ServerUrl url(given);
        EXPECT_EQ(url.text(), whole);
        EXPECT_EQ(url.isEncrypted(), isEncrypted) << given;
        EXPECT_EQ(url.isLoopback(), isLoopback) << given;
    }
}

std::string message(const std::string& id, const std::string& content) {
    return "<MESSAGE ID='" + id + "' PROTOCOLVERSION='1.0'><SIMPLERSP>" + content + "</SIMPLERSP></MESSAGE>";
}

/// An attribute of a request, by the end of its element's name and its own.
std::string valueOf(const std::string& name, const std::string& request) {
    const std::size_t start = request.find(name + "=\"") + name.size() + 2;
    return request.substr(start, request.find('"', start) - start);
}

/// What is sent for this, where the server gives a piece of a list, and then knows no operation at all.
std::string sentFor(const std::function<void(core::CimOperations&)>& work) {
    std::string sent;
    const ToldServer server([&](int client, const std::string& request) {
        sent += request + "\n";
        std::erase(sent, '\r');
        const bool isMethod = request.find("<METHODCALL") != std::string::npos;
        const std::string name = valueOf("METHODCALL NAME", request);
        const std::string content =
            name.starts_with("Open")
                ? "<IRETURNVALUE></IRETURNVALUE><PARAMVALUE NAME='EnumerationContext' PARAMTYPE='string'>"
                  "<VALUE>x</VALUE></PARAMVALUE>"
                : "<ERROR CODE='7'/>";
        const std::string element = isMethod ? "METHODRESPONSE" : "IMETHODRESPONSE";
        ToldServer::sendResponse(
            client, message(valueOf("MESSAGE ID", request),
                            "<" + element + " NAME='" + name + "'>" + content + "</" + element + ">"));
    });
    EXPECT_THROW(work(*server.connect().operations), core::CimError);
    return sent;
}

TEST(RemoteConnectionTest, SendsEachOperationWithItsParameters) {
    const core::CimPath path("Y.Name=\"1 ä\"");
    const core::AssociationFilter by{"A", "B", "c", "d"};
    const core::PropertyFilter some{{"P", "Q"}};
    const std::function<void(core::CimOperations&)> table[] = {
        [&](auto& operations) { operations.enumerateInstances("Y", some); },
        [&](auto& operations) { operations.enumerateInstanceNames("Y"); },
        [&](auto& operations) { operations.getInstance(path, some); },
        [&](auto& operations) { operations.associators(path, by, some); },
        [&](auto& operations) { operations.associators(core::CimPath("Y", {}), {}); },
        [&](auto& operations) { operations.associatorNames(path, by); },
        [&](auto& operations) { operations.references(path, by, some); },
        [&](auto& operations) {
            operations.referenceNames(path, {"", "B", "c", "d"});
        },
        [&](auto& operations) { operations.invokeMethod(path, "X y", {}); },
        [&](auto& operations) { operations.deleteInstance(path); },
        [&](auto& operations) {
            operations.createInstance({path, {}});
        },
        [&](auto& operations) { operations.getClass("Y"); },
    };
    std::string sent;
    for (const auto& work : table)
        sent += sentFor(work);
    const auto expected = test::readTestFile(QUENX_CLI_TEST_DIR "/samples/requests");
    EXPECT_EQ(sent, std::string(expected.begin(), expected.end()));
}

TEST(RemoteConnectionTest, TakesNoAnswerForAnotherRequestsOrForNothing) {
    const std::string returned = "<RETURNVALUE><VALUE>0</VALUE></RETURNVALUE></METHODRESPONSE>";
    const char* const other = "The server's answer belongs to another request.";
    const auto call = [](const std::string& response) {
        ToldServer(response).connect().operations->invokeMethod(core::CimPath("Y.Name=\"1\""), "X", {});
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
    EXPECT_FALSE(ToldServer(table[0].first).connect().control->checkImage("", "", {}, {}))
        << "a server that has only the model";
    const ToldServer server(message("1", "<METHODRESPONSE NAME='EnumerateInstanceNames'>" + returned));
    EXPECT_THROW(server.connect().operations->enumerateInstanceNames("Y"), cli::NoAnswer);
    const ToldServer confused(
        message("1",
                "<IMETHODRESPONSE NAME='GetInstance'><IRETURNVALUE><INSTANCE CLASSNAME='Y'><PROPERTY "
                "NAME='name' TYPE='string'><VALUE>2</VALUE></PROPERTY></INSTANCE></IRETURNVALUE>"
                "</IMETHODRESPONSE>"));
    EXPECT_THAT([&] { confused.connect().operations->getInstance(core::CimPath("Y.Name=\"1\"")); },
                ThrowsMessage<cli::NoAnswer>(HasSubstr("is about another object than Y.Name=\"1\".")));
}

TEST(RemoteConnectionTest, SendsAChangeOnce) {
    const struct {
        int connections;  ///< on which a request arrived
        const char* said;
        void (*call)(core::CimOperations& operations, const core::CimPath& path);
    } table[] = {
        {2, "cannot be read", [](auto& operations, const auto& path) { operations.getInstance(path); }},
        {1, "without an answer.",
         [](auto& operations, const auto& path) { operations.invokeMethod(path, "X", {}); }},
        {1, "without an answer.",
         [](auto& operations, const auto& path) { operations.deleteInstance(path); }},
    };
    const core::CimPath path("Y.Name=\"1\"");
    for (const auto& row : table) {
        std::atomic<int> sent{0};
        const ToldServer server([&](int client, const std::string& request) {
            // The library may connect again before it is kept from sending again.
            if (!request.empty()) ++sent;
            // The connection is kept; the next request on it is taken, and gets no answer.
            ToldServer::sendBytes(client, "HTTP/1.1 200 OK\r\nContent-Length: 0\r\n\r\n");
            std::array<char, 4096> bytes{};
            ::recv(client, bytes.data(), bytes.size(), 0);
        });
        const cli::Connection connection = server.connect();
        EXPECT_THROW(row.call(*connection.operations, path), cli::NoAnswer);
        EXPECT_THAT([&] { row.call(*connection.operations, path); },
                    ThrowsMessage<cli::NoAnswer>(HasSubstr(row.said)));
        EXPECT_EQ(sent, row.connections);
    }
}

const std::string kBusy =
    "The server is busy, or it blocks log-ins from this address for a while after wrong passwords. ";

std::string classBelow(const std::string& name, const std::string& superclass) {
    return "<CLASS NAME='" + name + "' SUPERCLASS='" + superclass + "'/>";
}

TEST(RemoteConnectionTest, BuildsNoEndlessChainsOfClasses) {
    const auto read = [](const std::string& classes) {
        const ToldServer server(message("1", "<IMETHODRESPONSE NAME='EnumerateClasses'><IRETURNVALUE>" +
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

TEST(RemoteConnectionTest, GivesUpAnswersWithoutEnd) {
    const std::string piece(std::size_t{1} << 20, ' ');
    std::atomic<int> sent{0};
    for (const std::string head : {"", "Content-Length: 10737418240\r\n"}) {
        const ToldServer server([&](int client, const std::string&) {
            ToldServer::sendBytes(client, "HTTP/1.1 200 OK\r\nConnection: close\r\n" + head + "\r\n");
            while (ToldServer::sendBytes(client, piece))
                ++sent;
        });
        EXPECT_THAT(
            [&] { server.connect().operations->getInstance(core::CimPath("Y.Name=\"1\"")); },
            ThrowsMessage<cli::NoAnswer>(HasSubstr(" is larger than 64 MiB and was not read to its end.")));
    }
    EXPECT_LT(sent, 128);
    // Nor does a list come to an end because its pieces are small.
    const ToldServer server([](int client, const std::string& request) {
        ToldServer::sendResponse(
            client, message(valueOf("MESSAGE ID", request),
                            "<IMETHODRESPONSE NAME='" + valueOf("IMETHODCALL NAME", request) +
                                "'><IRETURNVALUE></IRETURNVALUE><PARAMVALUE NAME='EndOfSequence' "
                                "PARAMTYPE='boolean'><VALUE>FALSE</VALUE></PARAMVALUE><PARAMVALUE "
                                "NAME='EnumerationContext' PARAMTYPE='string'><VALUE>x</VALUE></PARAMVALUE>"
                                "</IMETHODRESPONSE>"));
    });
    EXPECT_THAT([&] { server.connect().operations->enumerateInstanceNames("Y"); },
                ThrowsMessage<cli::NoAnswer>(HasSubstr(" is larger than 256 MiB ")));
}

TEST(RemoteConnectionTest, SaysWhatAnHttpStatusMeans) {
    const std::pair<const char*, std::string> table[] = {
        {"401 X",
         "The server does not accept the user name and password. Check --user or QUENXCTL_USER, and "
         "QUENXCTL_PASSWORD or what was typed."},
        {"403 X",
         "This user may not use the server. On quenx-cimd, log in as root, as a member of the group "
         "quenx-admin, or as a user whom its setting auth.readers names."},
        {"503 X\r\nRetry-After: 7", kBusy + "Try again in 7 seconds."},
        {"503 X\r\nretry-after:Fri, 31 Dec 1999 23:59:59 GMT", kBusy + "Try again in a while."},
        {"501 X\r\nCIMError: unsupported-operation",
         "The server answered with HTTP status 501 (unsupported-operation). Check that --server names a "
         "CIM-XML server; its log has the details."},
    };
    for (const auto& [head, said] : table) {
        const ToldServer server([&head = head](int client, const std::string&) {
            ToldServer::sendBytes(client, "HTTP/1.1 " + std::string(head) +
                                              "\r\nConnection: close\r\nContent-Length: 0\r\n\r\n");
        });
        try {
            server.connect().operations->getInstance(core::CimPath("Y.Name=\"1\""));
            ADD_FAILURE() << head;
        } catch (const cli::CommandError& error) {
            EXPECT_EQ(error.what() + (' ' + error.advice()), said);
        }
    }
}

TEST(RemoteConnectionTest, ReadsAListWholeFromAServerWithoutPieces) {
    int requests = 0;
    const ToldServer server([&](int client, const std::string& request) {
        const std::string id = std::to_string(++requests);
        const auto answers = [&](const std::string& name, const std::string& content) {
            if (request.find('"' + name + '"') == std::string::npos) return;
            ToldServer::sendResponse(client, message(id, "<IMETHODRESPONSE NAME='" + name + "'>" + content +
                                                             "</IMETHODRESPONSE>"));
        };
        answers("OpenEnumerateInstancePaths", "<ERROR CODE='7'/>");
        answers("EnumerateInstanceNames", "<IRETURNVALUE><INSTANCENAME CLASSNAME='Y'/></IRETURNVALUE>");
        answers("EnumerateInstances", "<IRETURNVALUE></IRETURNVALUE>");
    });
    const cli::Connection connection = server.connect();
    EXPECT_EQ(connection.operations->enumerateInstanceNames("Y").size(), 1U);
    EXPECT_EQ(connection.operations->enumerateInstanceNames("Y").size(), 1U);
    EXPECT_TRUE(connection.operations->enumerateInstances("Y").empty());
    EXPECT_EQ(requests, 4);  // it does not ask again
}

/// A server with paths of its own that gives this answer, and keeps what it was asked.
struct ControlServer {
    ControlServer(const std::string& head, const std::string& body)
        : server([=, this](int client, const std::string& request) {
              asked = request;
              std::erase(asked, '\r');
              ToldServer::sendBytes(client, "HTTP/1.1 " + head + "\r\nConnection: close\r\nContent-Length: " +
                                                std::to_string(body.size()) + "\r\n\r\n" + body);
          }),
          control(server.connect().control) {}

    std::string asked;
    const ToldServer server;
    const std::shared_ptr<cli::ServerControl> control;
};
constexpr const char* kControl = "200 OK\r\nQuenx-Interface: 1";

TEST(ServerControlTest, ReadsWhatTheServerTells) {
    EXPECT_EQ(ControlServer(kControl, R"({"claim": null})").control->held()->adapter, "");
    EXPECT_FALSE(ControlServer("200 OK", R"({"claim": null})").control->held()) << "another program's";
    const auto held = [](const std::string& holder, const char* user) {
        return *ControlServer(kControl, R"({"claim": {"adapter": "eth0", "holder": ")" + holder +
                                            R"(", "job": "J#1", "isNeeded": true, "user": )" + user +
                                            R"(, "since": "20260102030405.000000+000"}})")
                    .control->held();
    };
    EXPECT_EQ(held("job", "null").text(), "J#1");
    EXPECT_EQ(held("verification", "\"ann\"").text(), "a verification of ann");
    nlohmann::ordered_json json = held("check", "\"ann\"");
    EXPECT_EQ(
        json.dump(),
        R"({"holder":"check","user":"ann","job":"J#1","since":"20260102030405.000000+000","needed":true})");
    json = cli::HeldAdapter{.adapter = "eth0"};
    EXPECT_EQ(json.dump(), R"({"holder":"","user":null,"job":null,"since":null,"needed":false})");

    ControlServer released(kControl, R"({"released": true})");
    EXPECT_EQ(released.control->release("eth0"), true);
    EXPECT_EQ(
        released.asked,
        "POST /quenx/v1/release HTTP/1.1\nHost: localhost\nAccept: */*\nContent-Type: application/json\n"
        "Content-Length: 18\n\n{\"adapter\":\"eth0\"}");
    ControlServer checked(kControl, R"({"returnValue": 4097, "signedBy": "k"})");
    EXPECT_EQ(checked.control->checkImage("file:///x", "T", {5, 3}, {"IMG_PXE"}), 4097U);
    EXPECT_TRUE(checked.asked.starts_with("POST /quenx/v1/check HTTP"));
    EXPECT_TRUE(
        checked.asked.ends_with(R"({"options":[5,3],"target":"T","uri":"file:///x","values":["IMG_PXE"]})"));
    const ControlServer trusted(
        kControl, R"({"images": [{"asked": true, "key": "k", "reasonId": "QX-0707", "why": "w"}]})");
    const auto images = trusted.control->trustOf({"file:///x"});
    EXPECT_TRUE(images->at(0).isAsked);
    EXPECT_EQ(images->at(0).key + images->at(0).why + core::reasonCode(images->at(0).reason), "kwQX-0707");
}

TEST(ServerControlTest, RefusesAnswersThatItCannotRead) {
    const std::string unreadable = "The server's answer cannot be read.";
    const std::tuple<std::string, std::string, std::string> table[] = {
        {kControl, "{}", unreadable},
        {kControl, "[]", unreadable},
        {kControl, "{", unreadable},
        {kControl, R"({"images": []})", unreadable},
        {"409 X\r\nQuenx-Interface: 1", R"({"error": "it is needed"})", "The server refuses: it is needed."},
        {"403 X\r\nQuenx-Interface: 1", R"({"error": "you may not"})", "you may not"},
        {"404 X\r\nQuenx-Interface: 1", "{}", "The server answered with HTTP status 404."},
        {"404 X\r\nQuenx-Interface: 1", "[1]", "The server answered with HTTP status 404."},
        {"401 X", "", "The server does not accept the user name and password."},
        {"403 X", "", "This user may not use the server."},
        {"503 X", "", kBusy.substr(0, kBusy.size() - 1)},
    };
    for (const auto& [head, body, said] : table) {
        const ControlServer server(head, body);
        EXPECT_THAT([&] { server.control->trustOf({"file:///x"}); },
                    ThrowsMessage<std::exception>(StrEq(said)))
            << head << body;
    }
    EXPECT_FALSE(ControlServer("404 X", "").control->trustOf({""}));
}

}  // namespace
