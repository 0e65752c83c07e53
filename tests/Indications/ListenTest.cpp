// SPDX-License-Identifier: Apache-2.0
// quenxctl listen where it is not left in peace. What it prints is in the recorded session Listen.
#include <gmock/gmock.h>

#include <csignal>
#include <memory>

#include "Indications/OneUpdate.h"
#include "Indications/SubscriptionClient.h"

namespace {

using test::Program;
using test::ProgramResult;
using test::RunningDaemon;
using ::testing::HasSubstr;

/// Listens to the daemon until it is ended.
class Listening {
  public:
    explicit Listening(const RunningDaemon& daemon)
        : m_program({QUENXCTL, "--server", "http://127.0.0.1:" + std::to_string(daemon.httpPort()), "--user",
                     "admin", "listen"},
                    Program::Output::Pipes, {"QUENXCTL_PASSWORD=admin"}) {
        EXPECT_TRUE(m_program.waitFor("until it is interrupted."));
    }

    Program& program() { return m_program; }

  private:
    Program m_program;
};

/// The value of a property of the only instance of the class.
std::string onlyValue(const RunningDaemon& daemon, const std::string& className,
                      const std::string& property) {
    const test::SubscriptionClient client(daemon);
    const auto answer = client.call("EnumerateInstances", client.className(className));
    return answer.document.select_node(("//PROPERTY[@NAME='" + property + "']/VALUE").c_str())
        .node()
        .text()
        .get();
}

TEST(ListenTest, EndsWhenNobodyReadsIt) {
    const RunningDaemon daemon;
    Listening listening(daemon);
    listening.program().closeOutput();
    test::update(daemon);
    EXPECT_THAT(listening.program().finish().error, HasSubstr("Cannot write the output"));
    EXPECT_EQ(test::SubscriptionClient(daemon).count("CIM_IndicationSubscription"), 0U);
}

TEST(ListenTest, HearsTheServerBesideConnectionsOnWhichNothingComes) {
    const RunningDaemon daemon;
    Listening listening(daemon);
    const std::string url = onlyValue(daemon, "CIM_ListenerDestinationCIMXML", "Destination");
    const int port = std::stoi(url.substr(url.rfind(':') + 1));
    std::vector<std::unique_ptr<test::RawConnection>> silent;
    for (int i = 0; i < 20; ++i)
        silent.push_back(std::make_unique<test::RawConnection>(port, "127.0.0.1"));
    silent.front()->send("POST /");
    test::RawConnection stranger(port, "127.0.0.1");
    stranger.send("POST /elsewhere HTTP/1.1\r\nContent-Length: 1\r\n\r\nx");
    EXPECT_THAT(stranger.receive(), HasSubstr("404"));
    test::update(daemon);
    EXPECT_TRUE(listening.program().waitFor("deleted  Completed"));
    listening.program().send(SIGINT);
    EXPECT_THAT(listening.program().finish().out, HasSubstr("created  New  0 %"));
}

TEST(ListenTest, SaysWhenItHearsNothing) {
    const RunningDaemon daemon({"--indications-destinations", "192.0.2.0/24"});
    Listening listening(daemon);
    test::update(daemon);
    EXPECT_TRUE(listening.program().waitFor("The server cannot reach http://127.0.0.1:"));
    const test::SubscriptionClient client(daemon);
    const auto names = client.call("EnumerateInstanceNames", client.className("CIM_IndicationSubscription"));
    EXPECT_EQ(client.remove(test::SubscriptionClient::xmlOf(names.result().first_child())).error, 0);
    const ProgramResult result = listening.program().finish();
    EXPECT_THAT(result.error, HasSubstr("The server has this subscription no more."));
    EXPECT_EQ(client.count("CIM_IndicationFilter"), 6U);
    EXPECT_EQ(result.status, 1);
}

}  // namespace
