// SPDX-License-Identifier: Apache-2.0
// What the daemon serves beside CIM-XML: who holds an adapter, checks that hold none, images that are sent.
#include <gmock/gmock.h>

#include <fnmatch.h>

#include <filesystem>
#include <regex>

#include "Control/Sha256.h"
#include "System/RawConnection.h"
#include "System/RunningDaemon.h"

namespace {

using test::RawConnection;
using ::testing::AllOf;
using ::testing::ContainsRegex;
using ::testing::EndsWith;
using ::testing::HasSubstr;

constexpr const char* kAdmin = "Authorization: Basic YWRtaW46YWRtaW4=";
constexpr const char* kGuest = "Authorization: Basic Z3Vlc3Q6Z3Vlc3Q=";

/// The path that wbemcli prints, as XML.
std::string nameOf(const std::string& path) {
    static const std::regex kKey("(\\w+)=\"([^\"]*)\"");
    std::string xml = "<INSTANCENAME CLASSNAME=\"" + path.substr(0, path.find('.')) + "\">";
    for (std::sregex_iterator each(path.begin(), path.end(), kKey), end; each != end; ++each)
        xml += "<KEYBINDING NAME=\"" + (*each)[1].str() + "\"><KEYVALUE>" + (*each)[2].str() +
               "</KEYVALUE></KEYBINDING>";
    return xml + "</INSTANCENAME>";
}

std::string sumOf(const std::string& bytes) {
    control::Sha256 hash;
    hash.add(bytes.data(), bytes.size());
    return hash.take();
}

class ControlTest : public ::testing::Test {
  protected:
    ControlTest() { std::filesystem::create_directory(m_daemon.folder() / "firmware"); }

    /// An answer to bytes, by a connection of its own.
    std::string answerTo(const std::string& bytes) const {
        const RawConnection connection(m_daemon.httpPort(), "127.0.0.1");
        connection.send(bytes);
        connection.endSending();
        return connection.receive();
    }
    std::string put(const std::string& place, const std::string& sum, const std::string& body,
                    const std::string& login = kAdmin, std::size_t more = 0) const {
        return answerTo("PUT /quenx/v1/images/" + place + " HTTP/1.1\r\nHost: localhost\r\nQuenx-SHA256: " +
                        sum + "\r\nConnection: close\r\n" + login +
                        "\r\nContent-Length: " + std::to_string(body.size() + more) + "\r\n\r\n" + body);
    }
    test::ProgramResult remote(const std::string& line) const {
        return test::run({"/bin/sh", "-c", "exec quenxctl --server http://127.0.0.1:$0 --user admin " + line,
                          std::to_string(m_daemon.httpPort())},
                         {"PATH=" QUENX_PROGRAMS ":/usr/bin:/bin", "QUENXCTL_PASSWORD=admin"});
    }
    std::size_t files() const {
        std::size_t count = 0;
        for (const auto& each : std::filesystem::recursive_directory_iterator(m_daemon.folder() / "images"))
            if (each.is_regular_file()) ++count;
        return count;
    }

    test::RunningDaemon m_daemon{{"--uploads-image-bytes", "200000"}, {"QUENX_LOG=stderr"}};
};

/// CheckSoftwareIdentity, as a client sends it that knows no more than the model.
class ClaimTest : public ControlTest, public ::testing::WithParamInterface<bool> {
  protected:
    ClaimTest() {
        const test::TempFolder& folder = m_daemon.folder();
        std::filesystem::copy(m_daemon.image(), folder / "firmware");
        folder.write("provider.conf", "FWFilePath=" + folder.path() + "/firmware\n");
        if (GetParam()) folder.write("policy.toml", "release_claim_after_check = true\n");
    }
    /// The path of the instance that has this in it.
    std::string pathOf(const std::string& className, const std::string& part) const {
        for (const std::string& path : m_daemon.lines("ein", className))
            if (test::contains(path, part)) return nameOf(path);
        return "";
    }
    /// Its return value.
    std::string check(const std::string& adapter) const {
        const auto argument = [](const std::string& name, const std::string& path) {
            return "<PARAMVALUE NAME=\"" + name + "\"><VALUE.REFERENCE>" + path +
                   "</VALUE.REFERENCE></PARAMVALUE>";
        };
        const std::string answer = answerTo(test::httpRequest(
            "<?xml version=\"1.0\"?><CIM CIMVERSION=\"2.0\" DTDVERSION=\"2.0\"><MESSAGE ID=\"1\" "
            "PROTOCOLVERSION=\"1.0\"><SIMPLEREQ><METHODCALL "
            "NAME=\"CheckSoftwareIdentity\"><LOCALINSTANCEPATH>"
            "<LOCALNAMESPACEPATH><NAMESPACE NAME=\"root\"/><NAMESPACE NAME=\"cimv2\"/></LOCALNAMESPACEPATH>" +
            pathOf("Quenx_SoftwareInstallationService", "") + "</LOCALINSTANCEPATH>" +
            argument("Source", pathOf("Quenx_SoftwareIdentity", "Quenx:1af4-")) +
            argument("Target", pathOf("Quenx_EthernetPort", adapter)) +
            "</METHODCALL></SIMPLEREQ></MESSAGE></CIM>"));
        const std::size_t from = answer.find("<VALUE>", answer.find("<RETURNVALUE")) + 7;
        return answer.substr(from, answer.find('<', from) - from);
    }
};

TEST_P(ClaimTest, OfACheckStaysUntilItIsFreedUnlessThePolicyGivesItBack) {
    EXPECT_EQ(check("eth0"), "0");
    EXPECT_EQ(check("eth1"), GetParam() ? "0" : "2");
    // Who does what is no business of those who may only read.
    for (const auto& [login, user] : {std::pair(kAdmin, "\"admin\""), {kGuest, "null"}}) {
        const std::string answer = answerTo("GET /quenx/v1/status HTTP/1.1\r\nHost: localhost\r\n" +
                                            std::string(login) + "\r\nConnection: close\r\n\r\n");
        const std::string held =
            "{\"claim\":{\"adapter\":\"eth0\",\"holder\":\"check\",\"isNeeded\":false,"
            "\"job\":null,\"since\":\"*\",\"user\":" +
            std::string(user) + "}}\n";
        const std::string expected = "HTTP/1.1 200 *\r\n\r\n" + (GetParam() ? "{\"claim\":null}\n" : held);
        EXPECT_EQ(::fnmatch(expected.c_str(), answer.c_str(), 0), 0) << answer;
    }
    const std::string install = "install --target eth0 " + m_daemon.image();
    if (!GetParam()) {
        const test::ProgramResult refused = remote(install + " --force");
        EXPECT_EQ(refused.status, 1);
        EXPECT_THAT(refused.error, HasSubstr("eth0 is held by a check of admin, which has ended.\n"
                                             "Free it with \"quenxctl release eth0\""));
        // No history is served here: the answer itself has the id.
        EXPECT_THAT(remote(install + " --force --json").out, HasSubstr("\"reasonId\": \"QX-0402\""));
        EXPECT_THAT(remote("status").out,
                    AllOf(HasSubstr("\neth0 (simulated)  a check of admin  20"),
                          EndsWith("What holds eth0 has ended. Free it with \"quenxctl release eth0\".\n")));
        EXPECT_EQ(remote("release eth1").out, "eth1 was not held.\n");
        EXPECT_EQ(remote("release 0000:03:00.0").out, "eth0 is free again.\n");
    }
    EXPECT_EQ(remote(install).status, 0);
    EXPECT_THAT(remote("status").out,
                AllOf(HasSubstr("\neth0 (simulated)  -        -      -    Completed (Quenx:"),
                      ::testing::Not(HasSubstr("What holds"))));
    EXPECT_EQ(remote("check --force --target eth0 " + m_daemon.image()).status, 0);
    EXPECT_THAT(remote("check --json --target eth0 file:///none").out,
                HasSubstr("\"reasonId\": \"QX-0202\""));
    const std::string lines = m_daemon.stop().out;
    EXPECT_THAT(lines, ContainsRegex("operation=\"CheckImage\" .* sha256=\"[0-9a-f]+\""));
    EXPECT_THAT(lines, ContainsRegex("operation=\"CheckImage\" .* reason=\"QX-0202\""));
    const std::string freed = "operation=\"ReleaseClaim\" target=\"eth0\" arguments=\"\" outcome=\"done\"";
    EXPECT_EQ(test::contains(lines, freed), !GetParam()) << lines;
}

INSTANTIATE_TEST_SUITE_P(Policy, ClaimTest, ::testing::Bool());

TEST_F(ControlTest, RefusesWhatIsNoUpload) {
    const std::string body(1000, 'x');
    const std::string sum = sumOf(body);
    const struct {
        std::string what, place, sum, body, login, text;
        int status;
        std::size_t more = 0;
    } rows[] = {
        {"wrong sum", sumOf("y") + "/a", sumOf("y"), body, kAdmin, "did not arrive as it was sent", 422},
        {"a hidden slash", sum + "/..%2Fa", sum, body, kAdmin, "cannot be the name of an image", 400},
        {"too large", sum + "/a", sum, std::string(200001, 'x'), kAdmin, "uploads.image_bytes", 413},
        {"not an administrator", sum + "/a", sum, body, kGuest, "Quenx-Reason: QX-0502", 403},
        {"nobody", sum + "/a", sum, body, "X: y", "", 401},
        {"cut off", sum + "/a", sum, body, kAdmin, "", 0, 1}};
    const std::string images = m_daemon.folder() / "images";
    std::filesystem::create_directory(images);
    EXPECT_EQ(test::statusOf(put(sum + "/a", sum, body)), 500) << "others may need that folder";
    std::filesystem::permissions(images, std::filesystem::perms(0700));
    for (const auto& row : rows) {
        const std::string answer = put(row.place, row.sum, row.body, row.login, row.more);
        EXPECT_EQ(test::statusOf(answer), row.status) << row.what;
        EXPECT_THAT(answer, HasSubstr(row.text)) << row.what;
        EXPECT_EQ(files(), 0U) << row.what;
    }
    m_daemon.folder().write("policy.toml", "administrators = []\n");
    EXPECT_EQ(test::statusOf(put(sum + "/a", sum, body)), 403);
    // One line for each, but for nobody's.
    std::string outcomes = m_daemon.stop().out;
    for (const char* why :
         {"failed: the file cannot be stored: ", "failed: the file did not arrive as it was sent: ",
          "failed: \\\"", "failed: the file has 200001 bytes", "denied: user guest may only read",
          "failed: the client went away before all had come", "denied: "}) {
        const std::string line = "operation=\"UploadImage\" ";
        outcomes.erase(0, outcomes.find(line));
        EXPECT_THAT(outcomes.substr(0, outcomes.find('\n')), HasSubstr(" outcome=\"" + std::string(why)));
        outcomes.erase(0, line.size());
    }
    EXPECT_THAT(outcomes, ::testing::Not(HasSubstr("UploadImage")));
}

TEST(FullDiskTest, RefusesAnUploadAndLosesNothing) {
    // No file of the daemon's may grow beyond this.
    test::RunningDaemon daemon({"--uploads-image-bytes", "500000", "--uploads-total-bytes", "500000"}, {},
                               {"/usr/bin/prlimit", "--fsize=400000", "--nofile=256:1000"});
    const auto limits = test::readTestFile("/proc/" + std::to_string(daemon.program().id()) + "/limits");
    EXPECT_THAT(std::string(limits.begin(), limits.end()), ContainsRegex("Max open files +448 +1000 "));
    const std::string image = daemon.folder().write("large.rom", std::string(400001, 'x'));
    const auto send = [&](const std::string& file) {
        return test::run({QUENXCTL, "--server", "http://127.0.0.1:" + std::to_string(daemon.httpPort()),
                          "--user", "admin", "install", "--force", "--target", "eth0", "--upload", file},
                         {"QUENXCTL_PASSWORD=admin"});
    };
    EXPECT_EQ(send(daemon.image()).status, 0);
    const test::ProgramResult refused = send(image);
    EXPECT_EQ(refused.status, 1);
    EXPECT_THAT(refused.error, HasSubstr("there is no room for the file below "));
    EXPECT_THAT(daemon.lines("ein", "Quenx_SoftwareIdentityResource"), ::testing::SizeIs(1));
    EXPECT_EQ(send(daemon.image()).status, 0) << "the room of the other one is free again";
}

}  // namespace
