// SPDX-License-Identifier: Apache-2.0
#include "Host/Authentication/Authentication.h"

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <ctime>
#include <thread>

#include "Support/TempFolder.h"

namespace {

using namespace std::chrono_literals;
using host::AuthenticationOutcome;
using host::Credentials;
using host::User;
using ::testing::HasSubstr;
using ::testing::ThrowsMessage;

TEST(UsersFileTest, ChecksPasswords) {
    const test::TempFolder folder;
    const std::string odd = "a:b <&>\" \xC3\xBC%n";
    const std::string file = folder / "users";
    host::writeUsersFile(
        file, {{"admin", {host::hashPassword(odd), true}}, {"guest", {host::hashPassword("guest"), false}}});
    struct stat status {};
    ASSERT_EQ(::stat(file.c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777U, 0600U);
    host::UsersFile users(file);
    const auto admin = users.check({"admin", odd}, "");
    ASSERT_TRUE(admin);
    EXPECT_TRUE(admin->isAdministrator && admin->mayRead);
    EXPECT_FALSE(users.check({"guest", "guest"}, "")->isAdministrator);
    // In processor time, which a busy machine does not change, an unknown user costs what a known one does:
    // without a decoy it would be a thousandth.
    const auto cost = [&](const Credentials& wrong) {
        const std::clock_t start = std::clock();
        EXPECT_FALSE(users.check(wrong, "")) << wrong.user;
        return std::clock() - start;
    };
    const std::clock_t known = std::max(cost({"admin", "guest"}), cost({"admin", ""}));
    EXPECT_GT(cost({"nobody", odd}) * 10, known);
    EXPECT_GT(cost({"", ""}) * 10, known);
}

TEST(UsersFileTest, SaysWhatIsWrongWithAFile) {
    const test::TempFolder folder;
    const std::string file = folder / "users";
    const auto expectProblem = [](const std::string& path, const std::string& part) {
        EXPECT_THAT([&] { host::readUsersFile(path); }, ThrowsMessage<std::runtime_error>(HasSubstr(part)));
    };
    const std::string hash = host::hashPassword("x");
    folder.write("users", "# comment\n\nadmin:" + hash + ":admin\n");
    ::chmod(file.c_str(), 0640);
    expectProblem(file, "chmod 600");
    ::chmod(file.c_str(), 0600);
    EXPECT_EQ(host::readUsersFile(file).size(), 1U);
    expectProblem(folder / "missing", "missing: ");
    expectProblem(folder.path(), "not a regular file");
    const std::pair<std::string, std::string> table[] = {
        {"admin:" + hash + "\n", ":1: the role"},
        {"\nadmin:secret:admin\n", ":2: there is no password hash"},
        {":" + hash + ":admin\n", ":1: expected name:hash:role"},
        {"a:" + hash + ":admin\na:" + hash + ":admin\n", ":2: user \"a\" is listed twice"}};
    for (const auto& [content, expected] : table) {
        folder.write("users", content);
        expectProblem(file, expected);
    }
    // Only root can make a file of another user.
    if (::chown(file.c_str(), 1, 1) == 0) expectProblem(file, "Run: chown root");
}

TEST(FailureDelaysTest, GrowWithFailures) {
    host::FailureDelays delays;
    auto now = std::chrono::steady_clock::now();
    const auto waitOf = [&](const std::string& address) {
        const auto turn = delays.admit(address, now);
        return turn ? std::chrono::duration_cast<std::chrono::milliseconds>(*turn - now) : -1ms;
    };
    EXPECT_EQ(waitOf("192.0.2.1"), 0ms);
    for (const auto expected : {100ms, 200ms, 400ms, 800ms, 1600ms, 3200ms, 5000ms, 5000ms}) {
        delays.failed("192.0.2.1", now);
        EXPECT_EQ(waitOf("192.0.2.1"), expected);
        now += 20s;
    }
    EXPECT_EQ(waitOf("192.0.2.2"), 0ms);
    // Attempts at the same time take turns, and too many of them are not waited for.
    for (const auto expected : {0ms, 5000ms, 10000ms, -1ms})
        EXPECT_EQ(waitOf("192.0.2.1"), expected);
    delays.succeeded("192.0.2.1");
    EXPECT_EQ(waitOf("192.0.2.1"), 0ms);

    delays.failed("2001:db8::1", now);
    EXPECT_EQ(waitOf("2001:db8::2"), 100ms);  // the same network
    EXPECT_EQ(waitOf("2001:db8:1::1"), 0ms);
    now += 16min;
    delays.failed("192.0.2.9", now);
    EXPECT_EQ(waitOf("2001:db8::1"), 0ms);  // forgotten
}

/// Knows one password, and counts how often it is asked.
class CountingChecker : public host::PasswordChecker {
  public:
    explicit CountingChecker(std::atomic<int>& asked) : m_asked(asked) {}
    std::optional<User> check(const Credentials& credentials, const std::string&) override {
        ++m_asked;
        if (credentials.password != "\xC3\xBC:x") return std::nullopt;
        return User{credentials.user, false, credentials.user != "stranger"};
    }

  private:
    std::atomic<int>& m_asked;
};

class AuthenticationTest : public ::testing::Test {
  protected:
    AuthenticationOutcome outcome(const char* header, const std::string& address = "192.0.2.1") {
        return m_authentication->authenticate(header, address).outcome;
    }

    // As clients write them, with blanks and without the "=" at the end: "admin" and "\xC3\xBC:x".
    const char* const m_right = "basic   YWRtaW46w7w6eA ";
    // "admin\xC3\xBC" and ":x": the same bytes, divided elsewhere.
    const char* const m_wrong = "Basic YWRtaW7DvDo6eA==";
    const char* const m_stranger = "Basic c3RyYW5nZXI6w7w6eA==";
    std::atomic<int> m_asked{0};
    std::optional<host::Authentication> m_authentication{std::in_place,
                                                         std::make_unique<CountingChecker>(m_asked), 60s};
};

TEST_F(AuthenticationTest, AsksOnceForRightCredentials) {
    EXPECT_EQ(m_authentication->authenticate({}, "").outcome, AuthenticationOutcome::Missing);
    for (const char* bad : {"", "Bearer YWRtaW46w7w6eA", "Basic", "Basic YTpi!!", "Basic A",
                            "Basic YWRtaW4=", "Basic YQA6Yg=="})
        EXPECT_EQ(outcome(bad), AuthenticationOutcome::Missing) << bad;
    for (int i = 0; i < 3; ++i)
        EXPECT_EQ(outcome(m_right), AuthenticationOutcome::Accepted);
    EXPECT_EQ(m_asked, 1);
    EXPECT_EQ(outcome(m_stranger), AuthenticationOutcome::Forbidden);
    m_authentication->reload();
    EXPECT_EQ(outcome(m_right), AuthenticationOutcome::Accepted);
    EXPECT_EQ(m_asked, 3);
    host::Authentication forgetful(std::make_unique<CountingChecker>(m_asked), 0s);
    for (int i = 0; i < 2; ++i)
        EXPECT_EQ(forgetful.authenticate(m_right, "").outcome, AuthenticationOutcome::Accepted);
    EXPECT_EQ(m_asked, 5);
}

TEST_F(AuthenticationTest, MakesWrongCredentialsWaitAndNobodyElse) {
    m_authentication.emplace(std::make_unique<CountingChecker>(m_asked), 0s);
    EXPECT_EQ(outcome(m_right), AuthenticationOutcome::Accepted);
    const auto start = std::chrono::steady_clock::now();
    for (int i = 0; i < 3; ++i)
        EXPECT_EQ(outcome(m_wrong), AuthenticationOutcome::Wrong);
    EXPECT_GE(std::chrono::steady_clock::now() - start, 300ms);

    // Attempts from the address queue up, until one would have to wait for too long.
    std::atomic<int> refused{0};
    std::vector<std::thread> waiting;
    while (refused == 0) {
        waiting.emplace_back([&] {
            if (outcome(m_wrong) == AuthenticationOutcome::Busy) ++refused;
        });
    }
    EXPECT_EQ(outcome(m_right), AuthenticationOutcome::Accepted);  // it was right before
    EXPECT_EQ(outcome(m_stranger, "192.0.2.2"), AuthenticationOutcome::Forbidden);
    const int before = refused;
    m_authentication->stop();
    for (std::thread& each : waiting)
        each.join();
    EXPECT_GT(refused, before) << "the stop lets go of those who wait";
}

}  // namespace
