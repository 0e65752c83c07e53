// SPDX-License-Identifier: Apache-2.0
#include "Host/Authentication/Authentication.h"

#include <arpa/inet.h>
#include <crypt.h>
#include <dlfcn.h>
#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstring>
#include <ctime>
#include <filesystem>
#include <thread>

#include "Host/Authentication/ClientAddress.h"
#include "Host/Operations/Dispatcher.h"
#include "Host/Server/HttpServer.h"
#include "Support/SyslogCapture.h"
#include "Support/TempFolder.h"
#include "System/RawConnection.h"

namespace {

std::atomic<bool> isMemoryShort{false};

}  // namespace

/// Stands before the library's, which does the work as long as there is memory.
extern "C" char* crypt_r(const char* phrase, const char* setting, crypt_data* data) noexcept {
    static const auto real = reinterpret_cast<decltype(&crypt_r)>(::dlsym(RTLD_NEXT, "crypt_r"));
    if (!isMemoryShort) return real(phrase, setting, data);
    errno = EINVAL;  // as the method that passwd uses says it
    return std::strcpy(data->output, "*0");
}

namespace {

using namespace std::chrono_literals;
using host::AuthenticationOutcome;
using host::Credentials;
using host::User;
using ::testing::AllOf;
using ::testing::HasSubstr;
using ::testing::StartsWith;
using ::testing::ThrowsMessage;

TEST(UsersFileTest, ChecksPasswords) {
    const test::TempFolder folder;
    const std::string odd = "a:b <&>\" \xC3\xBC%n";
    const std::string file = folder / "users";
    host::writeUsersFile(
        file, {{"admin", {host::hashPassword(odd), true}}, {"guest", {host::hashPassword("guest"), false}}});
    EXPECT_EQ(std::filesystem::status(file).permissions(), std::filesystem::perms(0600));
    host::UsersFile users(file);
    for (const char control : {'\0', '\r', '\x7F'})
        EXPECT_THROW(host::hashPassword(std::string("a") + control), std::runtime_error) << int{control};
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
    EXPECT_FALSE(users.check({"admin", std::string(600, 'x')}, "")) << "too long for any hash";
}

TEST(UsersFileTest, TakesOnlyNamesThatALineCanHold) {
    const std::string longest(64, 'a');
    for (const auto& name : {longest, std::string("a#"), std::string("\xC3\xBC!")})
        EXPECT_TRUE(host::isUserName(name)) << name;
    for (const auto& name : {longest + "a", std::string(), std::string("#a"), std::string("a:b"),
                             std::string("a b"), std::string("a\x7F")})
        EXPECT_FALSE(host::isUserName(name)) << name;
}

TEST(UsersFileTest, HashesAsTheSystemDoes) {
    const auto method = [](std::string hash) { return hash.erase(hash.find('$', hash.find('$', 1) + 1)); };
    EXPECT_EQ(method(host::hashPassword("x")), method(::crypt_gensalt(nullptr, 0, nullptr, 0)));
    EXPECT_THROW(host::hashPassword(std::string(600, 'x')), std::runtime_error) << "too long";
    const test::TempFolder folder;
    const std::string file = folder.write("file", "") + "/users";
    EXPECT_THAT([&] { host::writeUsersFile(file, {}); },
                ThrowsMessage<std::runtime_error>("Cannot write " + file + ": Not a directory" +
                                                  (::geteuid() == 0 ? ". Mend that" : ". Run as root") +
                                                  ", or name another file with --users."));
}

TEST(UsersFileTest, KeepsItsUsersWhereAReloadCannotBeMeant) {
    const test::TempFolder folder;
    const std::string hash = host::hashPassword("x");
    const std::string file = folder.write("users", "\xC3\xBC:" + hash + ":admin\r\n");
    ::chmod(file.c_str(), 0600);
    host::UsersFile users(file);
    for (const auto& [text, reason] :
         {std::pair("\n", "it is empty"), std::pair("a:$x:admin\n", "hash of a.")}) {
        folder.write("users", text);
        EXPECT_THAT([&] { users.reload(); }, ThrowsMessage<std::runtime_error>(HasSubstr(reason)));
        EXPECT_TRUE(users.check({"\xC3\xBC", "x"}, ""));
    }
    folder.write("users", "# the last user was deleted\n");
    const test::SyslogCapture log;
    users.reload();
    EXPECT_THAT(log.lines().at(0).text, HasSubstr(file + " names no user: nobody can log in"));
    EXPECT_FALSE(users.check({"\xC3\xBC", "x"}, ""));
    // Only root can make a file of another user.
    if (::chown(file.c_str(), 1, 1) != 0) return;
    EXPECT_THAT([&] { users.reload(); }, ThrowsMessage<std::runtime_error>(HasSubstr("Run: chown root")));
}

TEST(UsersFileTest, CallsNoPasswordWrongForWantOfMemory) {
    const test::TempFolder folder;
    host::writeUsersFile(folder / "users", {{"admin", {host::hashPassword("admin"), true}}});
    host::Authentication authentication(std::make_unique<host::UsersFile>(folder / "users"), 0s);
    host::Dispatcher dispatcher(host::Dispatcher::Namespaces{});
    host::HttpServer server({}, dispatcher, authentication);
    const int port = server.listen("127.0.0.1", 0, false);
    const auto answer = [&] {
        const test::RawConnection client(port, "127.0.0.1");
        client.send(test::httpRequest("no XML"));
        return client.receive();
    };
    isMemoryShort = true;
    const test::SyslogCapture log;
    EXPECT_THAT(answer(), AllOf(StartsWith("HTTP/1.1 503 "), HasSubstr("Retry-After: 10\r\n")));
    EXPECT_THAT(log.lines().at(0).text, HasSubstr("cannot check a password: cannot hash it, most likely"));
    isMemoryShort = false;
    EXPECT_THAT(answer(), AllOf(StartsWith("HTTP/1.1 400 "), HasSubstr("request-not-well-formed")));
}

TEST(ClientAddressTest, CountsAsOneWhatOneMachineHas) {
    const std::pair<const char*, const char*> table[] = {
        {"192.0.2.1", "192.0.2.1"},          {"127.0.0.1", "loopback"},
        {"127.255.0.9", "loopback"},         {"::1", "loopback"},
        {"2001:db8::1", "2001:db8::/64"},    {"2001:db8:0:0:ff01:ff:1:2", "2001:db8::/64"},
        {"2001:db8:1::1", "2001:db8:1::/64"}};
    for (const auto& [address, place] : table)
        EXPECT_EQ(host::placeOf(address), place);
    EXPECT_EQ(host::networkOf("127.0.0.2"), "127.0.0.2");
    for (const auto& [family, text] :
         {std::pair(AF_UNIX, "local"), {AF_INET, "0.0.0.0"}, {AF_INET6, "::"}, {AF_UNSPEC, "unknown"}}) {
        sockaddr_storage nobodys{};
        nobodys.ss_family = static_cast<sa_family_t>(family);
        EXPECT_EQ(host::addressText(reinterpret_cast<const sockaddr&>(nobodys)), text);
    }
    // As a socket shows it that serves both families.
    sockaddr_in6 mapped{};
    mapped.sin6_family = AF_INET6;
    ASSERT_EQ(::inet_pton(AF_INET6, "::ffff:192.0.2.1", &mapped.sin6_addr), 1);
    EXPECT_EQ(host::addressText(reinterpret_cast<const sockaddr&>(mapped)), "192.0.2.1");
}

bool isChanged = false;

/// Knows one password, unless it is changed, and counts how often it is asked.
class CountingChecker : public host::PasswordChecker {
  public:
    explicit CountingChecker(std::atomic<int>& asked) : m_asked(asked) {}
    std::optional<User> check(const Credentials& credentials, const std::string&) override {
        ++m_asked;
        if (isChanged || credentials.password != "\xC3\xBC:x") return std::nullopt;
        return User{credentials.user, false, credentials.user != "stranger"};
    }

  private:
    std::atomic<int>& m_asked;
};

class AuthenticationTest : public ::testing::Test {
  protected:
    AuthenticationOutcome outcome(const char* header, const std::string& address = "192.0.2.1",
                                  const std::stop_token& ended = {}) {
        return m_authentication->authenticate(header, address, ended).outcome;
    }
    void start(std::chrono::milliseconds delay, std::chrono::milliseconds leastAnswer) {
        m_authentication.emplace(std::make_unique<CountingChecker>(m_asked), 0s,
                                 host::LoginPace{delay, delay, delay, leastAnswer, 60s});
    }
    /// The same attempt all the time, by several at once, until the end of the scope.
    std::vector<std::jthread> crowd(const char* header, int size) {
        std::vector<std::jthread> threads;
        for (int i = 0; i < size; ++i) {
            threads.emplace_back([this, header](const std::stop_token& stop) {
                while (!stop.stop_requested())
                    EXPECT_NE(outcome(header, "192.0.2.1", stop), AuthenticationOutcome::Accepted);
            });
        }
        return threads;
    }

    // As clients write them, with blanks and without the "=" at the end: "admin" and "\xC3\xBC:x".
    const char* const m_right = "basic   YWRtaW46w7w6eA ";
    // "admin\xC3\xBC" and ":x": the same bytes, divided elsewhere.
    const char* const m_wrong = "Basic YWRtaW7DvDo6eA==";
    // Right for the user whose password the one above guesses.
    const char* const m_guessed = "Basic YWRtaW7DvDrDvDp4";
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

TEST_F(AuthenticationTest, LeavesOneAuditLineForEachRefusal) {
    start(0ms, 0ms);
    const test::LogLevelGuard level(1);
    const test::SyslogCapture log;
    EXPECT_EQ(outcome(m_right), AuthenticationOutcome::Accepted);
    outcome("Basic Og==");  // nobody's name
    EXPECT_EQ(outcome(m_wrong), AuthenticationOutcome::Wrong);
    EXPECT_EQ(outcome(m_stranger), AuthenticationOutcome::Forbidden);
    const auto lines = log.lines();
    ASSERT_EQ(lines.size(), 3U);  // and no backtrace
    const auto line = [](const std::string& user, const std::string& why) {
        return "[audit] user=\"" + user + "\" address=\"192.0.2.1\" operation=\"login\" target=\"\" " +
               "arguments=\"\" outcome=\"denied: " + why + "\"";
    };
    EXPECT_EQ(lines[0].text, line("", "wrong user or password"));
    EXPECT_EQ(lines[1].text, line("admin\\xc3\\xbc", "wrong user or password"));
    EXPECT_EQ(lines[2].text, line("stranger", "not admitted"));
}

TEST_F(AuthenticationTest, LetsACrowdThatGuessesKeepNobodyOut) {
    constexpr int kCrowd = 12;
    start(100ms, 0ms);
    EXPECT_EQ(outcome(m_right), AuthenticationOutcome::Accepted);
    m_authentication->reload();
    const auto guessers = crowd(m_wrong, kCrowd);
    while (m_asked < 3)
        std::this_thread::sleep_for(1ms);
    // Behind all of the crowd there would be as many checks before it.
    const auto checksBefore = [&](const char* header, const char* address, AuthenticationOutcome expected) {
        const int before = m_asked;
        EXPECT_EQ(outcome(header, address), expected);
        return m_asked - before;
    };
    EXPECT_LT(checksBefore(m_right, "192.0.2.1", AuthenticationOutcome::Accepted), kCrowd) << "known";
    EXPECT_LT(checksBefore(m_guessed, "192.0.2.2", AuthenticationOutcome::Accepted), kCrowd) << "elsewhere";
    // In its midst, a newcomer waits for his turn, and gets it.
    checksBefore(m_stranger, "192.0.2.1", AuthenticationOutcome::Forbidden);
}

TEST_F(AuthenticationTest, DelaysGuessesByPlaceAndByUser) {
    start(1h, 0ms);
    std::stop_source ended;
    ended.request_stop();
    const auto isDelayed = [&](const std::string& header, const char* address) {
        return outcome(header.c_str(), address, ended.get_token()) == AuthenticationOutcome::Busy;
    };
    EXPECT_EQ(outcome(m_wrong, "127.0.0.1"), AuthenticationOutcome::Wrong);
    EXPECT_TRUE(isDelayed(m_stranger, "127.0.0.2")) << "another address of loopback";
    EXPECT_TRUE(isDelayed(m_guessed, "192.0.2.2")) << "another place, the same user";
    // Of long names 64 bytes count: two names of 65, and one that is shorter.
    std::string longest = "Basic ";
    for (int i = 0; i < 21; ++i)
        longest += "YWFh";
    EXPECT_EQ(outcome((longest + "YWI6eA").c_str(), "192.0.2.3"), AuthenticationOutcome::Wrong);
    EXPECT_TRUE(isDelayed(longest + "YWM6eA", "192.0.2.4"));
    EXPECT_FALSE(isDelayed(longest + "OmI", "192.0.2.5"));
    // Whoever was right once, and is wrong now, guesses as all others do.
    EXPECT_EQ(outcome(m_right, "192.0.2.6"), AuthenticationOutcome::Accepted);
    m_authentication->reload();
    isChanged = true;
    EXPECT_FALSE(isDelayed(m_right, "192.0.2.6"));
    EXPECT_TRUE(isDelayed(m_right, "192.0.2.6"));
    isChanged = false;
}

TEST_F(AuthenticationTest, AnswersEveryFailureAfterTheSameTime) {
    start(0ms, 200ms);
    const auto begin = std::chrono::steady_clock::now();
    EXPECT_EQ(outcome(m_wrong), AuthenticationOutcome::Wrong);
    EXPECT_GE(std::chrono::steady_clock::now() - begin, 200ms) << "though the check took no time";
    // Those who wait for the answer are in nobody's way.
    start(0ms, 1h);
    const auto waiting = crowd(m_wrong, 5);
    while (m_asked < 6)
        std::this_thread::sleep_for(1ms);
    EXPECT_EQ(outcome(m_right), AuthenticationOutcome::Accepted);

    host::LoginQueue queue({.leastAnswer = 100ms});
    EXPECT_EQ(queue.answerAfter(1ms), 100ms);
    EXPECT_EQ(queue.answerAfter(150ms), 300ms);
    EXPECT_EQ(queue.answerAfter(1ms), 300ms) << "as long for a user who is unknown, on a slow machine too";
    EXPECT_EQ(queue.answerAfter(10s), 800ms);
}

}  // namespace
