// What the daemon does with clients that mean it no good, while a good one goes on.
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <fstream>
#include <random>
#include <thread>

#include "Host/WireCheck.h"
#include "System/RawConnection.h"
#include "System/RunningDaemon.h"

namespace {

using namespace std::chrono_literals;
using test::httpRequest;
using test::RawConnection;
using test::statusOf;

using Clock = std::chrono::steady_clock;

constexpr const char* kBadAddress = "127.0.0.2";
#ifdef QUENX_SANITIZED
constexpr auto kPatience = 20s;
constexpr std::size_t kMostMemory = 4000;
#else
constexpr auto kPatience = 5s;
constexpr std::size_t kMostMemory = 150;  // MiB
#endif

const std::string& goodBody() {
    static const std::string body = test::readSample("w-EnumerateInstanceNames.xml");
    return body;
}

/// Asks all the time, each time on a new connection, and notes how long an answer takes.
class GoodClient {
  public:
    explicit GoodClient(int port) : m_port(port), m_thread([this] { run(); }) {}
    ~GoodClient() { stop(); }
    GoodClient(const GoodClient&) = delete;
    GoodClient& operator=(const GoodClient&) = delete;

    void stop() {
        m_stop = true;
        if (m_thread.joinable()) m_thread.join();
    }
    std::size_t failures() const { return m_failures; }
    std::size_t answers() const { return m_times.size(); }
    std::chrono::milliseconds p99() {
        std::sort(m_times.begin(), m_times.end());
        return std::chrono::duration_cast<std::chrono::milliseconds>(m_times[m_times.size() * 99 / 100]);
    }

  private:
    void run() {
        while (!m_stop) {
            const auto start = Clock::now();
            const RawConnection connection(m_port, "127.0.0.1");
            const bool sent = connection.isOpen() && connection.send(httpRequest(goodBody()));
            if (sent && statusOf(connection.receive(kPatience)) == 200) {
                m_times.push_back(Clock::now() - start);
            } else {
                ++m_failures;
            }
            std::this_thread::sleep_for(5ms);
        }
    }

    const int m_port;
    std::atomic<bool> m_stop{false};
    std::atomic<std::size_t> m_failures{0};
    std::vector<Clock::duration> m_times;
    std::thread m_thread;
};

class HostileInputTest : public ::testing::Test {
  protected:
    HostileInputTest()
        : m_daemon({"--limits-header-seconds", "1", "--limits-request-seconds", "2", "--limits-idle-seconds",
                    "2", "--limits-connections", "200", "--limits-connections-per-address", "100"}),
          m_client(m_daemon.httpPort()) {}

    void TearDown() override {
        m_client.stop();
        EXPECT_EQ(m_client.failures(), 0U);
        ASSERT_GT(m_client.answers(), 0U);
        EXPECT_LT(m_client.p99(), kPatience);
        const std::string name = ::testing::UnitTest::GetInstance()->current_test_info()->name();
        std::cout << name << ": a good client had " << m_client.answers() << " answers, p99 "
                  << m_client.p99().count() << " ms; the daemon took " << memory() << " MiB at most\n";
        EXPECT_LT(memory(), kMostMemory);
        EXPECT_EQ(m_daemon.stop().status, 0);
    }

    RawConnection attacker(const std::string& from = kBadAddress) const {
        return {m_daemon.httpPort(), from};
    }

    std::string answerTo(const std::string& bytes) const {
        const RawConnection connection = attacker();
        connection.send(bytes);
        return connection.receive(kPatience);
    }

    /// The most memory that the daemon has had, in MiB.
    std::size_t memory() {
        std::ifstream status("/proc/" + std::to_string(m_daemon.program().id()) + "/status");
        std::string word;
        while (status >> word && word != "VmHWM:") {
        }
        std::size_t kilobytes = 0;
        status >> kilobytes;
        return kilobytes / 1024;
    }

    test::RunningDaemon m_daemon;
    GoodClient m_client;
};

TEST_F(HostileInputTest, EndsConnectionsThatComeToNothing) {
    const std::string request = httpRequest(goodBody());
    const std::size_t head = request.find("\r\n\r\n");
    std::vector<RawConnection> silent;
    for (int i = 0; i < 50; ++i)
        silent.push_back(attacker());
    const RawConnection shortBody = attacker();
    shortBody.send(request.substr(0, request.size() - 10));
    const RawConnection noEnd = attacker();
    noEnd.send(request.substr(0, head));

    // A byte every tenth of a second moves all the time, and still comes to an end.
    const RawConnection slow = attacker();
    const auto start = Clock::now();
    std::size_t sent = 0;
    while (sent < head && slow.send(request.substr(sent, 1)) && Clock::now() - start < kPatience) {
        ++sent;
        std::this_thread::sleep_for(100ms);
    }
    EXPECT_LT(sent, head);
    EXPECT_LT(Clock::now() - start, kPatience);
    for (const RawConnection& connection : silent)
        EXPECT_TRUE(connection.isClosedWithin(kPatience));
    EXPECT_TRUE(shortBody.isClosedWithin(kPatience));
    EXPECT_TRUE(noEnd.isClosedWithin(kPatience));
}

TEST_F(HostileInputTest, RefusesWhatIsTooLarge) {
    std::string announced = httpRequest("");
    announced.replace(announced.find("Length: 0"), 9, "Length: 1073741824");
    EXPECT_EQ(statusOf(answerTo(announced)), 413);
    // The answer arrives though more of the body is on its way.
    EXPECT_EQ(statusOf(answerTo(announced + std::string(200000, 'x'))), 413);
    EXPECT_EQ(statusOf(answerTo(httpRequest(std::string(20000, 'x'), ""))), 401);
    EXPECT_EQ(statusOf(answerTo("POST /" + std::string(100000, 'a') + " HTTP/1.1\r\n\r\n")), 414);
    std::string headers = "POST /cimom HTTP/1.1\r\n";
    for (int i = 0; i < 10000; ++i)
        headers += "X-" + std::to_string(i) + ": y\r\n";
    EXPECT_EQ(statusOf(answerTo(headers)), 431);
    const RawConnection longer = attacker();
    longer.send(httpRequest(goodBody()) + "more than announced\r\n\r\n");
    EXPECT_EQ(statusOf(longer.receive(kPatience)), 200);
    EXPECT_TRUE(longer.isClosedWithin(kPatience));
}

TEST_F(HostileInputTest, RefusesBodiesByTheirFault) {
    std::string nested;
    for (int i = 0; i < 20000; ++i)
        nested += "<a>";
    const std::string bomb =
        "<!DOCTYPE l [<!ENTITY a 'aaaaaaaaaa'><!ENTITY b '&a;&a;&a;&a;&a;&a;'>]><CIM>&b;&b;&b;</CIM>";
    std::string badText = goodBody();
    badText.replace(badText.find("Quenx_"), 6, "Quen\xC3\x28");
    for (const std::string& body : {std::string("\0", 1), std::string(), nested, bomb, badText}) {
        const std::string answer = answerTo(httpRequest(body));
        EXPECT_EQ(statusOf(answer), 400) << body.substr(0, 40);
        EXPECT_NE(answer.find("CIMError: request-not-well-formed"), std::string::npos) << answer;
    }
    EXPECT_NE(answerTo(httpRequest("<CIM/>")).find("CIMError: request-not-valid"), std::string::npos);
    const auto changed = [](const std::string& from, const std::string& to) {
        std::string request = httpRequest(goodBody());
        return request.replace(request.find(from), from.size(), to);
    };
    EXPECT_EQ(statusOf(answerTo(changed("POST", "GET"))), 405);
    EXPECT_EQ(statusOf(answerTo(changed("POST", "M-POST"))), 501);
    EXPECT_EQ(statusOf(answerTo(changed("application/xml", "text/plain"))), 415);
    EXPECT_EQ(statusOf(answerTo(changed("Content-Length", "X-Length"))), 411);
    EXPECT_EQ(statusOf(answerTo(changed("CIMOperation: MethodCall", "CIMMethod: GetClass"))), 400);
    EXPECT_EQ(statusOf(answerTo(changed("CIMOperation", "CIMBatch"))), 501);
}

TEST_F(HostileInputTest, SurvivesPrefixesAndFlippedBits) {
    const std::string request = httpRequest(goodBody());
    const std::size_t end = request.find("</CIM>") + 6;
    for (std::size_t length = 0; length < end; ++length) {
        const RawConnection connection = attacker();
        connection.send(std::string_view(request).substr(0, length));
        connection.endSending();
        EXPECT_NE(statusOf(connection.receive(kPatience)), 200) << length;
    }
    std::mt19937 random(3);
    for (int round = 0; round < 1000; ++round) {
        std::string flipped = request;
        flipped[request.find("\r\n\r\n") + random() % goodBody().size()] ^=
            static_cast<char>(1U << random() % 8);
        const RawConnection connection = attacker();
        connection.send(flipped);
        connection.endSending();
        connection.receive(kPatience);
    }
}

TEST_F(HostileInputTest, TakesOddCredentialsForWrongOnes) {
    const std::string body = goodBody();
    for (int byte = 0; byte < 256; byte += 3) {
        std::string user = "ad";
        user += static_cast<char>(byte);
        // Each from an address of its own: an address that fails has to wait.
        const RawConnection connection = attacker("127.1.0." + std::to_string(byte));
        connection.send(httpRequest(body, user + ":\xFF" + user));
        EXPECT_EQ(statusOf(connection.receive(kPatience)), 401) << byte;
    }
    for (const char* header :
         {"Basic", "Basic !!!!", "Bearer x", "Digest username=\"admin\"", "Basic YQ=="}) {
        std::string request = httpRequest(body, "");
        request.insert(request.find("Content-Type"), std::string("Authorization: ") + header + "\r\n");
        const std::string answer = answerTo(request);
        EXPECT_EQ(statusOf(answer), 401) << header;
        EXPECT_NE(answer.find("WWW-Authenticate: Basic realm="), std::string::npos) << answer;
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
        connection.send(round % 10 == 0 ? httpRequest(goodBody()) : garbage);
        connection.endSending();
        EXPECT_TRUE(connection.isClosedWithin(kPatience)) << round;
    }
    const RawConnection hello = attacker();
    hello.send("\x16\x03\x01\x02\x01\xFC");
    EXPECT_TRUE(hello.isClosedWithin(kPatience));
    EXPECT_EQ(m_daemon.wbemcli("ein", "CIM_Service", {}, true).status, 0);
}

TEST_F(HostileInputTest, SurvivesTenThousandConnections) {
    for (int round = 0; round < 50; ++round) {
        std::vector<RawConnection> connections;
        for (int i = 0; i < 200; ++i)
            connections.push_back(attacker("127.0.0.3"));
        for (std::size_t i = 0; i < connections.size(); i += 10)
            connections[i].send("POST");
        std::this_thread::sleep_for(20ms);
    }
}

}  // namespace
