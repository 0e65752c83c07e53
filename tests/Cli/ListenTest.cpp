// SPDX-License-Identifier: Apache-2.0
// What comes to "quenxctl listen", right or wrong, and what it asks a server for.
#include <gtest/gtest.h>

#include <deque>
#include <future>
#include <regex>
#include <sstream>

#include "CimXml/Export.h"
#include "Cli/Display/Output.h"
#include "Cli/Update/Jobs.h"
#include "Cli/Verbs/Listener.h"
#include "Cli/Verbs/Verbs.h"
#include "Framework/Requests/CimRequests.h"
#include "System/RawConnection.h"

namespace {

using cli::CommandError;
using cli::ExitStatus;
using cli::Listener;
using core::CimPath;
using core::CimType;
using core::CimValue;
using core::InstanceValue;
using test::RawConnection;

constexpr const char* kBadRequest =
    "HTTP/1.1 400 Bad Request\r\nConnection: close\r\nContent-Length: 0\r\n\r\n";

/// The message and the advice of what is thrown.
std::string errorOf(const std::function<void()>& call) try {
    call();
    return "none";
} catch (const CommandError& error) {
    return std::string(error.what()) + "\n" + error.advice();
}

std::uint16_t portOf(const std::string& url) {
    return static_cast<std::uint16_t>(std::stoi(url.substr(std::string("http://127.0.0.1:").size())));
}

class ListenerTest : public ::testing::Test {
  protected:
    /// The body that has come, after all the rounds that it may take.
    std::string take(int rounds = 8) {
        for (int i = 0; i < rounds; ++i) {
            if (const auto delivered = m_listener->next(std::chrono::milliseconds(25))) {
                Listener::answer(*delivered, "<ok/>");
                return delivered->body;
            }
        }
        return "";
    }

    std::optional<Listener> m_listener{std::in_place, "127.0.0.1", 0, "/in"};
    const std::uint16_t m_port = portOf(m_listener->url());
};

TEST_F(ListenerTest, TakesMessagesAndAnswersWhatIsNone) {
    const std::string head = "POST /in HTTP/1.1\r\n";
    const std::string taken =
        "HTTP/1.1 200 OK\r\nContent-Type: application/xml; charset=utf-8\r\nCIMExport: MethodResponse\r\n"
        "Connection: close\r\nContent-Length: 5\r\n\r\n<ok/>";
    const std::string refused = "HTTP/1.1 404 Not Found\r\nConnection: close\r\nContent-Length: 0\r\n\r\n";
    const std::tuple<std::string, std::string, std::string> table[] = {
        {head + "CONTENT-length:\t3 \r\nX: y\r\n\r\nabcd", "abc", taken},
        {head + "X-Content-Length: 9\r\nContent-Length: 1\r\n\r\na", "a", taken},
        {"GET /in HTTP/1.1\r\nContent-Length: 1\r\n\r\na", "", refused},
        {"POST /inn HTTP/1.1\r\nContent-Length: 1\r\n\r\na", "", refused},
        {head + "Host: x\r\n\r\na", "", kBadRequest},
        {head + "Content-Length: 0\r\n\r\na", "", kBadRequest},
        {head + "Content-Length: 4194305\r\n\r\na", "", kBadRequest},
    };
    for (const auto& [request, body, answer] : table) {
        const RawConnection sender(m_port, "127.0.0.1");
        sender.send(request);
        EXPECT_EQ(take(), body) << request;
        EXPECT_EQ(sender.receive(), answer) << request;
    }
    // The longest of both.
    const RawConnection sender(m_port, "127.0.0.1");
    std::string longest = head + "X: ";
    longest.resize(16384, 'x');
    sender.send(longest);
    EXPECT_EQ(take(), "");
    sender.send("\r\nContent-Length: 4194304\r\n\r\n");
    auto sent = std::async(std::launch::async, [&] { return sender.send(std::string(4194304, 'y')); });
    EXPECT_EQ(take(10000), std::string(4194304, 'y'));
    EXPECT_TRUE(sent.get());
    EXPECT_EQ(sender.receive(), taken);
    const RawConnection other(m_port, "127.0.0.1");
    other.send(longest + "x");
    EXPECT_EQ(take(), "");
    EXPECT_EQ(
        other.receive(),
        "HTTP/1.1 431 Request Header Fields Too Large\r\nConnection: close\r\nContent-Length: 0\r\n\r\n");
    // The port is free again at once, and only then.
    EXPECT_EQ(errorOf([&] { const Listener second("127.0.0.1", m_port, "/in"); }),
              "Cannot listen on 127.0.0.1 port " + std::to_string(m_port) +
                  ": Address already in use.\nName an address of this machine with --address, and a free "
                  "port with --port.");
    m_listener.reset();
    EXPECT_EQ(Listener("127.0.0.1", m_port, "/").url(), "http://127.0.0.1:" + std::to_string(m_port) + "/");
    EXPECT_EQ(errorOf([] { const Listener second("::", 0, "/"); }),
              "--address is \"::\", which no server can reach.\nName one of this machine, as 192.0.2.7 or "
              "2001:db8::7.");
}

TEST_F(ListenerTest, LetsGoOfTheOldestSilentConnectionOfTooMany) {
    std::deque<RawConnection> senders;
    for (int i = 0; i < 16; ++i)
        senders.emplace_back(m_port, "127.0.0.1");
    senders[0].send("POST /in HTTP/1.1\r\nContent-Length: 2\r\n\r\na");
    EXPECT_EQ(take(24), "");
    senders.emplace_back(m_port, "127.0.0.1");
    EXPECT_EQ(take(), "");
    EXPECT_EQ(senders[1].receive(), "");
    senders[0].send("b");
    EXPECT_EQ(take(), "ab");
    senders[2].send("POST /in HTTP/1.1\r\nContent-Length: 1\r\n\r\nc");
    EXPECT_EQ(take(), "c");
}

template <class T>
core::PropertyValue property(const char* name, CimType type, const T& value) {
    return {name, CimValue::of(type, value), false, ""};
}

/// A server that tells what it is told to, as soon as there is a subscription.
class TellingServer : public core::CimRequests {
  public:
    std::vector<std::string> calls;  ///< without what is new each time
    std::future<void> told;          ///< ready when all of it is
    std::function<void(const std::string& url)> tell = [](const std::string&) {};
    std::size_t makes = 3;     ///< instances; for more it has no room
    bool isStubborn = false;   ///< deletes nothing
    bool isForgetful = false;  ///< has the subscription no more
    std::uint64_t state = 3;   ///< of the subscription: it cannot reach its listener

    TellingServer() : CimRequests("interop") {}
    CimPath createInstance(const InstanceValue& instance) override {
        std::string call = "make " + instance.path.getClassName();
        for (const core::PropertyValue& each : instance.properties)
            call += " " + each.name + "=" + cli::displayText(each.value);
        const std::string url = instance.text("Destination");
        if (!url.empty()) m_url = url;
        note(call);
        if (calls.size() > makes) throw core::CimError(core::CimStatus::Failed, "no room");
        if (calls.size() == 3) told = std::async(std::launch::async, [this] { tell(m_url); });
        return CimPath(instance.path.getClassName() + ".Name=\"" + instance.text("Name") + "\"");
    }
    void deleteInstance(const CimPath& path) override {
        note("delete " + path.toString());
        if (isStubborn) throw core::CimError(core::CimStatus::Failed, "no");
    }
    InstanceValue getInstance(const CimPath& path, const core::PropertyFilter&) override {
        if (isForgetful) throw core::CimError(core::CimStatus::NotFound, "none");
        return {path, {property("SubscriptionState", CimType::Uint16, state)}};
    }

  private:
    void note(const std::string& call) {
        calls.push_back(
            std::regex_replace(call, std::regex("quenxctl-[0-9]+-[0-9a-f]{16}|127\\.0\\.0\\.1:[0-9]+"), "*"));
    }
    std::string m_url;
};

class ListenVerbTest : public ::testing::Test {
  protected:
    ExitStatus listen(std::uint32_t count, bool isInProcess = false) {
        const cli::Connection connection{.operations = m_server,
                                         .history = nullptr,
                                         .isInProcess = isInProcess,
                                         .sharesFiles = m_sharesFiles};
        std::ostringstream lines;
        cli::LinePrinter printer(lines, {});
        cli::ProgressDisplay progress(printer);
        cli::Context context{.connection = connection,
                             .out = m_out,
                             .error = m_error,
                             .json = m_isJson,
                             .progress = progress,
                             .following = {.pause = [] {}, .interrupted = [this] { return m_isOver(); }},
                             .ask = cli::askOnTerminal};
        cli::VerbOptions options;
        options.listening.count = count;
        return cli::listen(context, options);
    }

    const std::shared_ptr<TellingServer> m_server = std::make_shared<TellingServer>();
    std::ostringstream m_out;
    std::ostringstream m_error;
    std::function<bool()> m_isOver = [] { return false; };
    bool m_isJson = false;
    bool m_sharesFiles = true;
};

const std::vector<std::string> kMade = {
    "make CIM_ListenerDestinationCIMXML SystemCreationClassName=\"CIM_ComputerSystem\" "
    "SystemName=\"localhost\" CreationClassName=\"CIM_ListenerDestinationCIMXML\" Name=\"*\" "
    "Destination=\"http://*/*\" PersistenceType=3",
    "make CIM_IndicationFilter SystemCreationClassName=\"CIM_ComputerSystem\" SystemName=\"localhost\" "
    "CreationClassName=\"CIM_IndicationFilter\" Name=\"*\" Query=\"SELECT * FROM CIM_InstIndication WHERE "
    "SourceInstance ISA CIM_ConcreteJob\" QueryLanguage=\"DMTF:CQL\"",
    "make CIM_IndicationSubscription Filter=CIM_IndicationFilter.Name=\"*\" "
    "Handler=CIM_ListenerDestinationCIMXML.Name=\"*\""};
const std::vector<std::string> kDeleted = {"delete CIM_IndicationSubscription.Name=\"\"",
                                           "delete CIM_IndicationFilter.Name=\"*\"",
                                           "delete CIM_ListenerDestinationCIMXML.Name=\"*\""};

/// All that are made, and how many of the deletions, those of what was made first.
std::vector<std::string> made(std::size_t deleted) {
    std::vector<std::string> calls = kMade;
    calls.insert(calls.end(), kDeleted.end() - static_cast<std::ptrdiff_t>(deleted), kDeleted.end());
    return calls;
}

constexpr const char* kJob = "Job#1\xE2\x80\xAE";  // nothing for a terminal

TEST_F(ListenVerbTest, PrintsWhatComesAndTakesItsSubscriptionAway) {
    const utils::Time time(2026, 1, 2, 3, 4, 5);
    const auto message = [&](const char* className, std::uint64_t state, const std::string& error) {
        const InstanceValue job{CimPath("Quenx_ConcreteJob", {}),
                                {property("InstanceID", CimType::String, std::string(kJob)),
                                 property("JobState", CimType::Uint16, state),
                                 property("PercentComplete", CimType::Uint16, std::uint64_t{40}),
                                 property("ErrorCode", CimType::Uint16, std::uint64_t{5}),
                                 property("ErrorDescription", CimType::String, error)}};
        cimxml::ExportedIndication told{
            className, {}, {{"SourceInstance", std::make_shared<InstanceValue>(job)}}};
        if (!error.empty())
            told.properties = {property("IndicationTime", CimType::Datetime, time),
                               property("SequenceNumber", CimType::Sint64, std::int64_t{7})};
        return cimxml::writeExport(told, "m");
    };
    std::vector<std::string> answers;
    m_server->tell = [&](const std::string& url) {
        for (const std::string& body :
             {message("CIM_InstCreation", 2, ""), std::string("<x/>"),
              message("CIM_InstModification", 10, "worn"), message("CIM_InstDeletion", 7, "-")}) {
            const RawConnection connection(portOf(url), "127.0.0.1");
            connection.send("POST " + url.substr(url.rfind('/')) + " HTTP/1.1\r\nContent-Length: " +
                            std::to_string(body.size()) + "\r\n\r\n" + body);
            const std::string answer = connection.receive();
            answers.push_back(answer.substr(answer.find("\r\n\r\n") + 4));
        }
    };
    const std::string moment = cli::momentText(time);
    const std::string taken = cimxml::writeExportAnswer("m");
    for (m_isJson = false;; m_isJson = true) {
        EXPECT_EQ(listen(3), ExitStatus::Done);
        m_server->told.get();
        EXPECT_EQ(answers, std::vector<std::string>({taken, "", taken, taken}));
        EXPECT_EQ(m_server->calls, made(3));
        if (m_isJson) break;
        EXPECT_EQ(m_out.str(), "-  Job#1\\xe2\\x80\\xae  created  New  40 %\n" + moment +
                                   "  Job#1\\xe2\\x80\\xae  changed  Exception  40 %  worn\n" + moment +
                                   "  Job#1\\xe2\\x80\\xae  deleted  Completed  40 %  -\n");
        m_out.str("");
        m_server->calls.clear();
        answers.clear();
    }
    const auto line = [&](const std::string& when, const std::string& what, int number,
                          const std::string& state, const std::string& error) {
        return R"({"time":")" + when + R"(","event":")" + what + R"(","number":)" + std::to_string(number) +
               R"(,"job":"Job#1\u202e","state":")" + state +
               R"(","percent":40,"errorCode":5,"errorDescription":")" + error + "\"}\n";
    };
    const std::string told = core::datetimeText(time);
    EXPECT_EQ(m_out.str(), line("-", "created", -1, "New", "") +
                               line(told, "changed", 7, "Exception", "worn") +
                               line(told, "deleted", 7, "Completed", "-"));
}

TEST_F(ListenVerbTest, SaysWhatStaysBehindAndLeavesNothingElse) {
    m_isOver = [] { return true; };
    EXPECT_EQ(listen(0), ExitStatus::Done);
    EXPECT_EQ(m_server->calls, made(3));
    EXPECT_TRUE(std::regex_match(m_error.str(), std::regex("Listening at http://127.0.0.1:[0-9]+/quenxctl-.* "
                                                           "until it is interrupted.\n")))
        << m_error.str();
    // There is room for two, which are taken away again.
    m_server->calls.clear();
    m_server->makes = 2;
    EXPECT_THROW(listen(0), core::CimError);
    EXPECT_EQ(m_server->calls, made(2));
    m_server->calls.clear();
    m_server->makes = 3;
    m_server->isStubborn = true;
    EXPECT_TRUE(std::regex_match(errorOf([this] { listen(0); }),
                                 std::regex("The server still has the subscription quenxctl-.*\\.\nNothing "
                                            "arrives there any more; it stays until an administrator deletes "
                                            "it\\.")));
    EXPECT_EQ(m_server->calls, made(3));
    m_sharesFiles = false;
    EXPECT_EQ(errorOf([this] { listen(0); }),
              "A server elsewhere has to know where to send.\nName the address at which it reaches this "
              "machine, with --address.");
    EXPECT_EQ(
        errorOf([this] { listen(0, true); }),
        "A server tells of its jobs, and none was named: there is nobody to listen to.\nName the server "
        "with --server. Root needs none on a machine on which quenx-cimd runs.");
}

/// Until the server is asked, which it is each few seconds.
TEST_F(ListenVerbTest, SaysThatTheServerCannotReachIt) {
    m_isOver = [this] { return m_error.str().find('\n') + 1 != m_error.str().size(); };
    EXPECT_EQ(listen(0), ExitStatus::Done);
    const std::string said = m_error.str();
    EXPECT_TRUE(std::regex_match(
        said.substr(said.find('\n') + 1),
        std::regex(
            "quenxctl: The server cannot reach http://127.0.0.1:[0-9]+/quenxctl-.*; its log says why.\n"
            "Name an address of this machine with --address that it can reach, and that its setting "
            "indications.destinations allows.\n")))
        << said;
}

TEST_F(ListenVerbTest, EndsWithItsSubscription) {
    m_server->isForgetful = true;
    EXPECT_EQ(errorOf([this] { listen(0); }),
              "The server has this subscription no more.\nAn administrator has deleted it, or the server has "
              "begun anew without it. Listen again.");
    EXPECT_EQ(m_server->calls, made(2));
}

}  // namespace
