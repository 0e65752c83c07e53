#include "Host/Authentication/Authentication.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <atomic>
#include <thread>

#include "Host/Authentication/BasicHeader.h"
#include "Host/Authentication/PamChecker.h"
#include "Host/Authentication/UsersFile.h"
#include "Support/ChildProcess.h"
#include "Support/TempFolder.h"

namespace {

using namespace std::chrono_literals;
using host::AuthenticationOutcome;
using host::Credentials;
using host::FailureDelays;
using host::Identity;

TEST(BasicHeaderTest, ReadsCredentials) {
    const struct {
        const char* header;
        const char* expected;
    } table[] = {
        {"Basic YWRtaW46c2VjcmV0", "admin|secret"},
        {"basic   YWRtaW46c2VjcmV0 ", "admin|secret"},
        {"Basic YTpiOmM=", "a|b:c"},
        {"Basic YTpiOmM", "a|b:c"},
        {"Basic Og==", "|"},
        {"Basic w7w6w6Q=", "\xC3\xBC|\xC3\xA4"},
        {"Basic YWRtaW4=", nullptr},  // no colon
        {"Basic YTpi!!", nullptr},
        {"Basic A", nullptr},
        {"Basic YQA6Yg==", nullptr},  // a NUL byte
        {"Digest YTpi", nullptr},
        {"", nullptr},
    };
    for (const auto& row : table) {
        const auto read = host::readBasicHeader(row.header);
        ASSERT_EQ(read.has_value(), row.expected != nullptr) << row.header;
        EXPECT_EQ(read ? read->user + "|" + read->password : "", row.expected ? row.expected : "");
    }
}

class UsersFileTest : public ::testing::Test {
  protected:
    std::string write(const std::string& content, mode_t mode = 0600) const {
        const std::string file = m_folder.write("users", content);
        ::chmod(file.c_str(), mode);
        return file;
    }

    std::string problem(const std::string& file) const {
        try {
            host::readUsersFile(file);
        } catch (const std::runtime_error& error) {
            return error.what();
        }
        return "";
    }

    test::TempFolder m_folder;
};

TEST_F(UsersFileTest, ChecksPasswords) {
    const std::string odd = "a:b <&>\" \xC3\xBC%n";
    const std::string file = m_folder / "users";
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
    for (const Credentials& wrong : {Credentials{"admin", "guest"}, Credentials{"admin", ""},
                                     Credentials{"nobody", odd}, Credentials{"", ""}}) {
        EXPECT_FALSE(users.check(wrong, "")) << wrong.user;
    }
    host::writeUsersFile(file, {});
    EXPECT_TRUE(users.check({"guest", "guest"}, ""));  // until it is told
    users.reload();
    EXPECT_FALSE(users.check({"guest", "guest"}, ""));
}

TEST_F(UsersFileTest, TakesAsLongForUnknownUsers) {
    const std::string file = m_folder / "users";
    host::writeUsersFile(file, {{"admin", {host::hashPassword("secret"), true}}});
    host::UsersFile users(file);
    const auto quickest = [&](const Credentials& credentials) {
        auto best = std::chrono::steady_clock::duration::max();
        for (int round = 0; round < 5; ++round) {
            const auto start = std::chrono::steady_clock::now();
            EXPECT_FALSE(users.check(credentials, ""));
            best = std::min(best, std::chrono::steady_clock::now() - start);
        }
        return best;
    };
    // Without a decoy the unknown user would be a thousand times as quick.
    EXPECT_GT(quickest({"unknown", "wrong"}) * 3, quickest({"admin", "wrong"}));
}

TEST_F(UsersFileTest, SaysWhatIsWrongWithAFile) {
    const std::string hash = host::hashPassword("x");
    EXPECT_EQ(problem(write("# comment\n\nadmin:" + hash + ":admin\n")), "");
    const std::pair<std::string, std::string> table[] = {
        {"admin:" + hash + "\n", ":1: the role"},
        {"\nadmin:secret:admin\n", ":2: no password hash"},
        {":" + hash + ":admin\n", ":1: no user name"},
        {"a:" + hash + ":admin\na:" + hash + ":admin\n", ":2: user a is there twice"}};
    for (const auto& [content, expected] : table) {
        EXPECT_NE(problem(write(content)).find(expected), std::string::npos) << content;
    }
    EXPECT_NE(problem(write("", 0640)).find("chmod 600"), std::string::npos);
    EXPECT_NE(problem(m_folder / "missing").find("missing: "), std::string::npos);
    EXPECT_NE(problem(m_folder.path()).find("no regular file"), std::string::npos);
    const std::string roots = write("");
    EXPECT_EQ(test::runAsNobody([&] { return problem(roots).empty() ? "read a file of root's" : ""; }), "");
}

TEST(PamCheckerTest, KnowsWhoMayDoWhat) {
    EXPECT_TRUE(host::identityOf("root", {}).isAdministrator);
    EXPECT_FALSE(host::identityOf("nobody", {}).mayRead);
    for (const char* reader : {"nobody", "*", "@nogroup"}) {
        const Identity identity = host::identityOf("nobody", {"somebody", reader});
        EXPECT_TRUE(identity.mayRead && !identity.isAdministrator) << reader;
    }
    EXPECT_FALSE(host::identityOf("nobody", {"@root", "@no-such-group"}).mayRead);
    EXPECT_FALSE(host::identityOf("no-such-user", {"*"}).mayRead);
    EXPECT_FALSE(host::PamChecker({"*"}).check({"no-such-user", "secret"}, "127.0.0.1"));
}

TEST(CredentialCacheTest, RemembersForAWhile) {
    host::CredentialCache cache(60s);
    const Credentials admin{"admin", "secret"};
    EXPECT_FALSE(cache.find(admin));
    cache.remember(admin, {"admin", true, true});
    EXPECT_TRUE(cache.find(admin)->isAdministrator);
    EXPECT_FALSE(cache.find({"admin", "secret "}));
    EXPECT_FALSE(cache.find({"admins", "ecret"}));
    cache.clear();
    EXPECT_FALSE(cache.find(admin));
    host::CredentialCache forgetful(0s);
    forgetful.remember(admin, {"admin", true, true});
    EXPECT_FALSE(forgetful.find(admin));
}

TEST(FailureDelaysTest, GrowWithFailures) {
    FailureDelays delays;
    const auto start = FailureDelays::Clock::now();
    const auto waitOf = [&](const std::string& address, FailureDelays::Clock::time_point now) {
        const auto turn = delays.admit(address, now);
        return turn ? std::chrono::duration_cast<std::chrono::milliseconds>(*turn - now) : -1ms;
    };
    EXPECT_EQ(waitOf("192.0.2.1", start), 0ms);
    auto now = start;
    for (const auto expected : {100ms, 200ms, 400ms, 800ms, 1600ms, 3200ms, 5000ms, 5000ms}) {
        delays.failed("192.0.2.1", now);
        EXPECT_EQ(waitOf("192.0.2.1", now), expected);
        now += 20s;
    }
    EXPECT_EQ(waitOf("192.0.2.2", now), 0ms);
    // Attempts at the same time take turns, and too many of them are not waited for.
    EXPECT_EQ(waitOf("192.0.2.1", now), 0ms);
    EXPECT_EQ(waitOf("192.0.2.1", now), 5000ms);
    EXPECT_EQ(waitOf("192.0.2.1", now), 10000ms);
    EXPECT_EQ(waitOf("192.0.2.1", now), -1ms);
    delays.succeeded("192.0.2.1");
    EXPECT_EQ(waitOf("192.0.2.1", now), 0ms);

    delays.failed("2001:db8::1", now);
    EXPECT_EQ(waitOf("2001:db8::2", now), 100ms);  // the same network
    EXPECT_EQ(waitOf("2001:db8:1::1", now), 0ms);
    delays.failed("192.0.2.9", now + 16min);
    EXPECT_EQ(waitOf("2001:db8::1", now + 16min), 0ms);  // forgotten
}

/// Knows one password, and counts how often it is asked.
class CountingChecker : public host::PasswordChecker {
  public:
    explicit CountingChecker(std::atomic<int>& asked) : m_asked(asked) {}
    std::optional<Identity> check(const Credentials& credentials, const std::string&) override {
        ++m_asked;
        if (credentials.password != "secret") return std::nullopt;
        return Identity{credentials.user, false, credentials.user != "stranger"};
    }

  private:
    std::atomic<int>& m_asked;
};

constexpr const char* kRight = "Basic YWRtaW46c2VjcmV0";         // admin:secret
constexpr const char* kWrong = "Basic YWRtaW46d3Jvbmc=";         // admin:wrong
constexpr const char* kStranger = "Basic c3RyYW5nZXI6c2VjcmV0";  // stranger:secret

TEST(AuthenticationTest, AsksOnceForRightCredentials) {
    std::atomic<int> asked{0};
    host::Authentication authentication(std::make_unique<CountingChecker>(asked), 60s);
    const auto outcome = [&](const std::optional<std::string>& header) {
        return authentication.authenticate(header, "192.0.2.1").outcome;
    };
    EXPECT_EQ(outcome(std::nullopt), AuthenticationOutcome::Missing);
    EXPECT_EQ(outcome("Basic !"), AuthenticationOutcome::Missing);
    for (int i = 0; i < 3; ++i)
        EXPECT_EQ(outcome(kRight), AuthenticationOutcome::Accepted);
    EXPECT_EQ(asked, 1);
    EXPECT_EQ(outcome(kStranger), AuthenticationOutcome::Forbidden);
    authentication.reload();
    EXPECT_EQ(outcome(kRight), AuthenticationOutcome::Accepted);
    EXPECT_EQ(asked, 3);
}

TEST(AuthenticationTest, MakesWrongCredentialsWaitAndNobodyElse) {
    std::atomic<int> asked{0};
    host::Authentication authentication(std::make_unique<CountingChecker>(asked), 60s);
    const auto outcome = [&](const char* header, const char* address) {
        return authentication.authenticate(header, address).outcome;
    };
    EXPECT_EQ(outcome(kRight, "192.0.2.1"), AuthenticationOutcome::Accepted);
    const auto start = std::chrono::steady_clock::now();
    for (int i = 0; i < 3; ++i)
        EXPECT_EQ(outcome(kWrong, "192.0.2.1"), AuthenticationOutcome::Wrong);
    EXPECT_GE(std::chrono::steady_clock::now() - start, 300ms);

    // The next one has to wait for long; a stop lets go of it.
    for (int i = 0; i < 5; ++i)
        outcome(kWrong, "192.0.2.2");
    std::thread waiting([&] { EXPECT_EQ(outcome(kWrong, "192.0.2.2"), AuthenticationOutcome::Busy); });
    const auto before = std::chrono::steady_clock::now();
    EXPECT_EQ(outcome(kRight, "192.0.2.2"), AuthenticationOutcome::Accepted);  // remembered
    EXPECT_EQ(outcome(kStranger, "192.0.2.3"), AuthenticationOutcome::Forbidden);
    EXPECT_LT(std::chrono::steady_clock::now() - before, 2s);
    authentication.stop();
    waiting.join();
}

}  // namespace
