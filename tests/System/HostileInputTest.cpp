// SPDX-License-Identifier: Apache-2.0
// What hostile clients can do to the daemon, while a good one goes on.
#include <gtest/gtest.h>
#include <sys/resource.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <list>
#include <map>
#include <random>
#include <regex>
#include <sstream>
#include <thread>

#include "CimXml/WireCheck.h"
#include "System/RawConnection.h"
#include "System/RunningDaemon.h"
#include "Utils/Utils.h"

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

/// For all classes with their texts: a large answer, which anybody who may read can have.
std::string requestForMuch() {
    std::string body = test::readSample("w-EnumerateClasses.xml");
    const std::string one =
        "<IPARAMVALUE NAME=\"ClassName\"><CLASSNAME NAME=\"Quenx_ConcreteJob\"/></IPARAMVALUE>";
    body.erase(body.find(one), one.size());
    const std::string texts = "IncludeQualifiers\"><VALUE>FALSE";
    return httpRequest(body.replace(body.find(texts), texts.size(), "IncludeQualifiers\"><VALUE>TRUE"));
}

/// While a test attacks, a good client asks all the time, each time on a new connection, and is answered.
class HostileInputTest : public ::testing::Test {
  protected:
    HostileInputTest()
        : m_daemon({"--limits-header-seconds", "3", "--limits-request-seconds", "4", "--limits-idle-seconds",
                    "8", "--limits-connections", "200", "--limits-connections-per-address", "100",
                    "--limits-answer-bytes", "4194304"},
                   {"QUENX_LOG=stderr"}),
          m_goodClient([this](const std::stop_token& stop) { goOnAsking(stop); }) {}

    void goOnAsking(const std::stop_token& stop) {
        do {
            EXPECT_EQ(statusOf(answerTo(m_request, "127.0.0.1")), 200);
            std::this_thread::sleep_for(5ms);
        } while (!stop.stop_requested());
    }

    void TearDown() override {
        m_goodClient.request_stop();
        m_goodClient.join();
        const test::ProgramResult result = m_daemon.stop();
        EXPECT_EQ(result.status, 0);
        EXPECT_LT(result.out.size(), 100000U) << "a flood must not fill the log";
        rusage usage{};
        ::getrusage(RUSAGE_CHILDREN, &usage);
        EXPECT_LT(usage.ru_maxrss / 1024, kMaxMemory);
    }

    std::string answerTo(const std::string& bytes, const std::string& address = kBadAddress) const {
        const RawConnection connection(m_daemon.httpPort(), address.c_str());
        connection.send(bytes);
        return connection.receive();
    }

    const std::string m_body = test::readSample("w-EnumerateInstanceNames.xml");
    const std::string m_request = httpRequest(m_body);
    const std::string m_largeRequest = requestForMuch();
    test::RunningDaemon m_daemon;
    std::jthread m_goodClient;
};

TEST_F(HostileInputTest, ClosesConnectionsThatAreTooSlow) {
    std::list<RawConnection> silent;
    for (int i = 0; i < 50; ++i)
        silent.emplace_back(m_daemon.httpPort(), kBadAddress);
    std::string lasting = m_request;
    const std::string close = "Connection: close\r\n";
    const RawConnection served(m_daemon.httpPort(), kBadAddress);
    served.send(lasting.erase(lasting.find(close), close.size()));

    // What moves a little every tenth of a second moves all the time, and still comes to an end.
    const RawConnection slowHead(m_daemon.httpPort(), kBadAddress);
    slowHead.send("POST /");
    const RawConnection slowBody(m_daemon.httpPort(), kBadAddress);
    const std::string large = httpRequest(std::string(10000, 'x'));
    slowBody.send(large.substr(0, large.find("\r\n\r\n") + 4));
    const RawConnection slowReader(m_daemon.httpPort(), kBadAddress, 4096);
    slowReader.send(m_largeRequest);
    std::string answer;
    int rounds = 0;
    for (bool moves = true; moves && rounds < 300; ++rounds) {
        const std::string piece = slowReader.receivePiece();
        answer += piece;
        const std::array moved{slowHead.send("x"), slowBody.send("x"), !piece.empty()};
        moves = std::count(moved.begin(), moved.end(), true) != 0;
        std::this_thread::sleep_for(100ms);
    }
    EXPECT_LT(rounds, 300);
    EXPECT_LT(answer.size(), std::stoul(answer.substr(answer.find("Content-Length: ") + 16)));
    EXPECT_EQ(statusOf(served.receive()), 200);
    for (const RawConnection& connection : silent)
        EXPECT_EQ(connection.receive(), "");
}

TEST_F(HostileInputTest, DropsSilentConnectionsForNewOnes) {
    // Ten thousand clients, of whom the last few hundred do not go by themselves.
    std::list<RawConnection> silent;
    for (int i = 0; i < 10000; ++i) {
        silent.emplace_back(m_daemon.httpPort(), ("127.0.0." + std::to_string(10 + i % 5)).c_str());
        if (i % 10 == 0) silent.back().send("POST");
        if (silent.size() > 600) silent.pop_front();
    }
    // Both one of the crowd and somebody new get in.
    for (const char* address : {"127.0.0.10", "127.0.0.20"})
        EXPECT_EQ(statusOf(answerTo(m_request, address)), 200) << address;
    EXPECT_TRUE(
        m_daemon.program().waitFor("limits.connections (200) reached: closed a connection that has not "));
    EXPECT_EQ(silent.front().receive(), "");
}

TEST_F(HostileInputTest, AnswersWhomTheDelaysOfOthersHadWaitForLong) {
    std::list<RawConnection> guessers;
    for (int i = 0; i < 8; ++i) {
        guessers.emplace_back(m_daemon.httpPort(), kBadAddress);
        guessers.back().send(httpRequest(m_body, "Authorization: Basic Z3Vlc3Q6eA=="));
    }
    std::this_thread::sleep_for(200ms);
    // Longer than a connection may be idle. The body comes by itself, as it does with TLS.
    const std::string request = httpRequest(m_body, "Authorization: Basic Z3Vlc3Q6Z3Vlc3Q=");
    const std::size_t head = request.size() - m_body.size();
    const RawConnection connection(m_daemon.httpPort(), kBadAddress);
    connection.send(request.substr(0, head));
    std::this_thread::sleep_for(200ms);
    connection.send(request.substr(head));
    EXPECT_EQ(statusOf(connection.receive()), 200);
    for (const RawConnection& guesser : guessers)
        EXPECT_EQ(statusOf(guesser.receive()), 401);
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
    // Below a status, and a header of the answer: what is changed in a right request; \n ends a line of it.
    const auto sample = test::readTestFile(QUENX_SYSTEM_TEST_DIR "/samples/changed-requests");
    std::istringstream rows(std::string(sample.begin(), sample.end()));
    std::string expected;
    int requests = 0;
    for (std::string row; std::getline(rows, row);) {
        const std::size_t arrow = row.find(" => ");
        if (arrow == std::string::npos) {
            expected = row;
            continue;
        }
        const std::string old = row.substr(4, arrow - 4);
        const std::string by = std::regex_replace(row.substr(arrow + 4), std::regex(R"(\\n)"), "\r\n");
        std::string request = m_request;
        const std::string answer = answerTo(request.replace(request.find(old), old.size(), by));
        EXPECT_EQ(statusOf(answer), std::stoi(expected)) << row;
        EXPECT_TRUE(test::contains(answer, expected.substr(std::min<std::size_t>(expected.size(), 4))))
            << answer;
        ++requests;
    }
    EXPECT_EQ(requests, 44);
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
    std::list<RawConnection> readers;
    for (int i = 0; i < 60; ++i) {
        readers.emplace_back(m_daemon.httpPort(), kBadAddress, 4096);
        readers.back().send(m_largeRequest);
    }
    // Each gets its answer before any has read to the end.
    std::map<int, int> answers;
    for (const RawConnection& reader : readers)
        ++answers[statusOf(reader.receivePiece())];
    EXPECT_GT(answers[200], 0);
    EXPECT_GT(answers[503], 0);
    EXPECT_EQ(answers[200] + answers[503], 60);
}

/// A megabyte and more of answer, whatever the headers of its request leave of the room that they share.
TEST(LargeAnswerTest, ArrivesBesideTheLongestHeaders) {
    const test::TempFolder folder;
    std::string adapters;
    for (int i = 0; i < 400; ++i) {
        adapters += "[[adapter]]\nname = 'eth" + std::to_string(i) + "'\npci_address = '" +
                    utils::formatStr("0000:%02x:%02x.0", 1 + i / 32, i % 32) +
                    "'\npci_id = '1af4:1041'\nmac = '" +
                    utils::formatStr("52:54:00:10:%02x:%02x", i / 256, i % 256) +
                    "'\nflash_file = '/usr/lib/ipxe/qemu/efi-virtio.rom'\n";
    }
    const test::RunningDaemon daemon({"--adapters-description", folder.write("many.toml", adapters)});
    std::string body = test::readSample("w-EnumerateInstances.xml");
    const std::size_t name = body.find("Quenx_ConcreteJob");
    body.replace(name, std::string("Quenx_ConcreteJob").size(), "CIM_ManagedElement");
    // With origins an answer is built in one piece.
    const std::string origin = "ClassOrigin\"><VALUE>TRUE";
    body.replace(body.find(origin), origin.size(), "ClassOrigin\"><VALUE>FALSE");
    std::string outcomes;
    for (std::size_t length = 31000; length < 32700; length += 100) {
        const RawConnection connection(daemon.httpPort(), "127.0.0.1");
        std::string request =
            httpRequest(body, "Authorization: Basic Z3Vlc3Q6Z3Vlc3Q=\r\nX: " + std::string(length, 'y'));
        // On a connection that is to be kept, and the head by itself, as most clients send it.
        const std::string close = "Connection: close\r\n";
        request.erase(request.find(close), close.size());
        const std::size_t head = request.size() - body.size();
        connection.send(request.substr(0, head));
        std::this_thread::sleep_for(50ms);
        connection.send(request.substr(head));
        std::string answer;
        while (!answer.ends_with("</CIM>\n")) {
            const std::string piece = connection.receivePiece();
            if (piece.empty()) break;
            answer += piece;
        }
        const std::string outcome =
            std::to_string(statusOf(answer)) +
            (answer.size() > 2'000'000 && answer.ends_with("</CIM>\n") ? " whole, " : ", ");
        if (!outcomes.ends_with(outcome)) outcomes += outcome;
    }
    EXPECT_EQ(outcomes, "200 whole, 0, 431, ") << "beside the longest the library closes without an answer";
}

}  // namespace
