// SPDX-License-Identifier: Apache-2.0
// What hostile clients can do to the daemon, while a good one goes on.
#include <gtest/gtest.h>
#include <sys/resource.h>

#include <algorithm>
#include <chrono>
#include <list>
#include <map>
#include <random>
#include <thread>

#include "CimXml/WireCheck.h"
#include "System/RawConnection.h"
#include "System/RunningDaemon.h"

namespace {

using namespace std::chrono_literals;
using test::httpRequest;
using test::RawConnection;
using test::statusOf;

constexpr const char* kBadAddress = "127.0.0.2";
#ifdef QUENX_SANITIZED
constexpr long kMaxMemory = 4000;
#else
constexpr long kMaxMemory = 150;  // MiB
#endif

/// While a test attacks, a good client asks all the time, each time on a new connection, and is answered.
class HostileInputTest : public ::testing::Test {
  protected:
    HostileInputTest()
        : m_daemon({"--limits-header-seconds", "3", "--limits-request-seconds", "4", "--limits-idle-seconds",
                    "3", "--limits-connections", "200", "--limits-connections-per-address", "100",
                    "--limits-answer-bytes", "4194304"},
                   {"QUENX_LOG=stderr"}),
          m_goodClient([this](const std::stop_token& stop) { goOnAsking(stop); }) {}

    void goOnAsking(const std::stop_token& stop) {
        do {
            const auto start = std::chrono::steady_clock::now();
            const RawConnection connection(m_daemon.httpPort(), "127.0.0.1");
            connection.send(httpRequest(m_body));
            EXPECT_EQ(statusOf(connection.receive()), 200);
            m_times.push_back(std::chrono::steady_clock::now() - start);
            std::this_thread::sleep_for(5ms);
        } while (!stop.stop_requested());
    }

    void TearDown() override {
        m_goodClient.request_stop();
        m_goodClient.join();
        std::sort(m_times.begin(), m_times.end());
        const auto p99 =
            std::chrono::duration_cast<std::chrono::milliseconds>(m_times[(m_times.size() - 1) * 99 / 100]);
        const test::ProgramResult result = m_daemon.stop();
        EXPECT_EQ(result.status, 0);
        EXPECT_LT(result.out.size(), 100000U) << "a flood must not fill the log";
        rusage usage{};
        ::getrusage(RUSAGE_CHILDREN, &usage);
        std::cout << "a good client had " << m_times.size() << " answers, p99 " << p99.count()
                  << " ms; a daemon took " << usage.ru_maxrss / 1024 << " MiB at most\n";
        EXPECT_LT(usage.ru_maxrss / 1024, kMaxMemory);
    }

    std::string answerTo(const std::string& bytes) const {
        const RawConnection connection(m_daemon.httpPort(), kBadAddress);
        connection.send(bytes);
        return connection.receive();
    }

    const std::string m_body = test::readSample("w-EnumerateInstanceNames.xml");
    const std::string m_request = httpRequest(m_body);
    test::RunningDaemon m_daemon;
    std::vector<std::chrono::steady_clock::duration> m_times;
    std::jthread m_goodClient;
};

TEST_F(HostileInputTest, ClosesConnectionsThatSendTooSlowly) {
    const std::size_t head = m_request.find("\r\n\r\n");
    std::list<RawConnection> silent;
    for (int i = 0; i < 50; ++i)
        silent.emplace_back(m_daemon.httpPort(), kBadAddress);
    const RawConnection shortBody(m_daemon.httpPort(), kBadAddress);
    shortBody.send(m_request.substr(0, m_request.size() - 10));
    const RawConnection noEnd(m_daemon.httpPort(), kBadAddress);
    noEnd.send(m_request.substr(0, head));

    // A byte every tenth of a second moves all the time, and still comes to an end.
    const RawConnection slow(m_daemon.httpPort(), kBadAddress);
    std::size_t sent = 0;
    while (sent < head && slow.send(m_request.substr(sent, 1))) {
        ++sent;
        std::this_thread::sleep_for(100ms);
    }
    EXPECT_LT(sent, head);
    for (const RawConnection& connection : silent)
        EXPECT_EQ(connection.receive(), "");
    shortBody.receive();
    noEnd.receive();
}

TEST_F(HostileInputTest, DropsSilentConnectionsForNewOnes) {
    std::list<RawConnection> silent;
    for (int i = 0; i < 600; ++i)
        silent.emplace_back(m_daemon.httpPort(), ("127.0.0." + std::to_string(10 + i % 5)).c_str());
    // Both one of the crowd and somebody new get in.
    for (const char* address : {"127.0.0.10", "127.0.0.20"}) {
        const RawConnection connection(m_daemon.httpPort(), address);
        connection.send(m_request);
        EXPECT_EQ(statusOf(connection.receive()), 200) << address;
    }
    EXPECT_TRUE(
        m_daemon.program().waitFor("limits.connections (200) reached: closed a connection that has not "));
    EXPECT_EQ(silent.front().receive(), "");
}

TEST_F(HostileInputTest, RefusesWhatIsTooLarge) {
    std::string announced = httpRequest("");
    announced.replace(announced.find("Length: 0"), 9, "Length: 1073741824");
    EXPECT_EQ(statusOf(answerTo(announced)), 413);
    // The answer arrives though more of the body is on its way.
    EXPECT_EQ(statusOf(answerTo(announced + std::string(200000, 'x'))), 413);
    EXPECT_EQ(statusOf(answerTo(httpRequest(std::string(20000, 'x'), "X: y"))), 401);
    EXPECT_EQ(statusOf(answerTo("POST /" + std::string(100000, 'a') + " HTTP/1.1\r\n\r\n")), 414);
    std::string headers = "POST /cimom HTTP/1.1\r\n";
    for (int i = 0; i < 10000; ++i)
        headers += "X-" + std::to_string(i) + ": y\r\n";
    EXPECT_EQ(statusOf(answerTo(headers)), 431);
    EXPECT_EQ(statusOf(answerTo(m_request + "more than announced\r\n\r\n")), 200);
}

TEST_F(HostileInputTest, RefusesARequestByItsFault) {
    const std::string type = "application/xml";
    const std::string length = "Content-Length: " + std::to_string(m_body.size());
    const std::string call = "CIMOperation: MethodCall";
    const struct {
        std::string from;
        std::string to;
        int status;
        const char* header;
    } table[] = {
        {"</CIM>", "</CIX>", 400, "CIMError: request-not-well-formed"},
        {"Authorization: Basic ", "X: ", 401, "WWW-Authenticate: Basic realm="},
        {type, "Text/XML; charset=\"UTF-8\"", 200, ""},
        {type, "text/xmlish", 415, ""},
        {type, "text/xml; charset=latin1", 415, ""},
        {"POST", "GET", 405, "Allow: POST"},
        {"POST", "M-POST", 501, ""},
        {length, "X: y", 411, ""},
        {length, "Transfer-Encoding: chunked", 411, ""},
        {length, "Content-Length: -1", 400, ""},
        {length, "Content-Length: 99999999999999999999", 413, ""},
        {length, length + "\r\n" + length, 200, ""},
        {length, length + "\r\nContent-Length: 5", 400, ""},
        {length, "Content-Length: 5\r\n" + length, 400, ""},
        {length, length + "\r\nContent-Encoding: gzip", 415, ""},
        {length, length + "\r\nContent-Encoding: identity", 200, ""},
        {call, "CIMOperation: methodcall\r\nCIMMethod: Enumerate%49nstanceNames", 200, ""},
        {call, "CIMMethod: GetClass", 400, "CIMError: header-mismatch"},
        {call, "CIMObject: root/interop", 400, "CIMError: header-mismatch"},
        {call, "CIMOperation: Other", 400, "CIMError: unsupported-operation"},
        {call, "CIMProtocolVersion: 2.0", 501, "CIMError: unsupported-protocol-version"},
        {call, "CIMBatch: MethodCall", 501, "CIMError: multiple-requests-unsupported"},
    };
    for (const auto& row : table) {
        std::string request = m_request;
        const std::string answer = answerTo(request.replace(request.find(row.from), row.from.size(), row.to));
        EXPECT_EQ(statusOf(answer), row.status) << row.to;
        EXPECT_NE(answer.find(row.header), std::string::npos) << answer;
    }
}

TEST_F(HostileInputTest, SurvivesGarbageInPlaceOfTls) {
    std::mt19937 random(5);
    for (int round = 0; round < 200; ++round) {
        std::string garbage(random() % 300, ' ');
        for (char& byte : garbage)
            byte = static_cast<char>(random());
        // Some begin as a handshake does.
        if (round % 2 == 0) garbage = "\x16\x03\x01" + garbage;
        const RawConnection connection(m_daemon.httpsPort(), kBadAddress);
        connection.send(round % 10 == 0 ? m_request : garbage);
        connection.endSending();
        connection.receive();
    }
    const RawConnection hello(m_daemon.httpPort(), kBadAddress);
    hello.send("\x16\x03\x01\x02\x01\xFC");
    hello.receive();
    EXPECT_EQ(m_daemon.wbemcli("ein", "CIM_Service", {}, true).status, 0);
}

TEST_F(HostileInputTest, BoundsTheMemoryOfAnswersThatNobodyReads) {
    // All classes with their texts: large, and anybody who may read can have them.
    std::string classes = test::readSample("w-EnumerateClasses.xml");
    const std::string one =
        "<IPARAMVALUE NAME=\"ClassName\"><CLASSNAME NAME=\"Quenx_ConcreteJob\"/></IPARAMVALUE>";
    classes.erase(classes.find(one), one.size());
    const std::string texts = "IncludeQualifiers\"><VALUE>FALSE";
    classes.replace(classes.find(texts), texts.size(), "IncludeQualifiers\"><VALUE>TRUE");
    std::list<RawConnection> readers;
    for (int i = 0; i < 60; ++i) {
        readers.emplace_back(m_daemon.httpPort(), kBadAddress, 4096);
        readers.back().send(httpRequest(classes));
    }
    for (const RawConnection& reader : readers)
        EXPECT_TRUE(reader.isAnswered());
    std::map<int, int> answers;
    for (const RawConnection& reader : readers)
        ++answers[statusOf(reader.receive())];
    EXPECT_GT(answers[200], 0);
    EXPECT_GT(answers[503], 0);
    EXPECT_EQ(answers[200] + answers[503], 60);
}

TEST_F(HostileInputTest, SurvivesTenThousandConnections) {
    for (int round = 0; round < 50; ++round) {
        std::list<RawConnection> connections;
        for (int i = 0; i < 200; ++i) {
            connections.emplace_back(m_daemon.httpPort(), "127.0.0.3");
            if (i % 10 == 0) connections.back().send("POST");
        }
        std::this_thread::sleep_for(20ms);
    }
}

}  // namespace
