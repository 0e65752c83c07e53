// SPDX-License-Identifier: Apache-2.0
#include "Indications/Delivery/Delivery.h"

#include <dlfcn.h>
#include <gtest/gtest.h>
#include <netdb.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <atomic>
#include <cstdlib>
#include <future>
#include <optional>
#include <string_view>

#include "Framework/Model/CimError.h"
#include "Indications/Delivery/Destination.h"
#include "Indications/Delivery/Pace.h"
#include "Indications/StrictListener.h"
#include "Support/Program.h"
#include "Support/TempFolder.h"
#include "Utils/Os/Linux/Thread.h"

namespace {

/// Look-ups of names that end in .slow.example last until it is true.
std::atomic<bool> g_nameServerAnswers{false};

}  // namespace

/// In the place of the C library's, for libcurl.
extern "C" [[gnu::visibility("default")]] int getaddrinfo(const char* name, const char* service,
                                                          const addrinfo* hints, addrinfo** found) {
    if (name != nullptr && std::string_view(name).ends_with(".slow.example")) {
        g_nameServerAnswers.wait(false);
        return EAI_AGAIN;
    }
    if (name != nullptr && std::string_view(name).ends_with(".dual.example")) {
        const int error = ::getaddrinfo("127.0.0.1", service, hints, found);
        return error == 0 ? ::getaddrinfo("::1", service, nullptr, &(*found)->ai_next) : error;
    }
    static const auto real = reinterpret_cast<decltype(&::getaddrinfo)>(::dlsym(RTLD_NEXT, "getaddrinfo"));
    return real(name, service, hints, found);
}

namespace {

using indications::Delivery;
using indications::DeliveryCounters;
using indications::DeliverySettings;
using test::StrictListener;
using Answer = StrictListener::Answer;
using Step = StrictListener::Step;

indications::AddressPolicy toLoopback() {
    return indications::AddressPolicy::onlyTo(indications::machineAddress("127.0.0.1").value());
}

DeliverySettings quick() {
    DeliverySettings settings;
    settings.retryPause = std::chrono::milliseconds(5);
    settings.wholeTime = std::chrono::seconds(30);  // on a busy machine
    settings.connectTime = std::chrono::seconds(30);
    settings.farewellTime = std::chrono::milliseconds(200);
    return settings;
}

/// A message that shows its number.
std::string numbered(const indications::Sequence& sequence) {
    return "<M ID=\"" + sequence.context + ' ' + std::to_string(sequence.number) + "\"/>";
}

/// Waits until so many messages have been delivered or given up, and none waits.
DeliveryCounters settled(const Delivery& delivery, const std::string& destination, std::uint64_t count) {
    while (true) {
        const DeliveryCounters counters = delivery.counters(destination);
        if (counters.delivered + counters.givenUp + counters.overflow >= count) return counters;
        utils::Thread::msleep(1);
    }
}

TEST(DeliveryTest, BringsEverythingInItsOrder) {
    constexpr std::size_t kMany = 10'000;
    DeliverySettings settings = quick();
    settings.mostWaiting = kMany;
    StrictListener listener;
    // What the environment says of proxies counts for those who use it.
    ::setenv("http_proxy", "http://127.0.0.1:1", 1);
    Delivery delivery(settings);
    delivery.add("one", listener.url(), toLoopback(), "c");
    delivery.add("two", "127.0.0.1:" + std::to_string(listener.port()), toLoopback(), "d");
    for (std::size_t i = 0; i < kMany; ++i)
        delivery.send("one", 1, numbered);
    delivery.send("two", 1, numbered);
    delivery.send("nobody", 1,
                  [](const auto&) -> std::string { throw std::runtime_error("never asked for"); });
    EXPECT_EQ(settled(delivery, "one", kMany).delivered, kMany);
    EXPECT_EQ(settled(delivery, "two", 1).delivered, 1U);
    ::unsetenv("http_proxy");
    std::vector<std::string> bodies = listener.waitFor(kMany + 1);
    EXPECT_EQ(std::erase(bodies, numbered({"d", 0})), 1U);
    for (std::size_t i = 0; i < kMany; ++i)
        ASSERT_EQ(bodies.at(i), numbered({"c", static_cast<std::int64_t>(i)}));
    EXPECT_EQ(listener.problems(), std::vector<std::string>());
}

TEST(DeliveryTest, SendsOneAddressABurstAndThenSoManyASecond) {
    using std::chrono::milliseconds;
    using std::chrono::seconds;
    using Moment = indications::Clock::time_point;
    indications::Pace pace(20);
    const Moment begin{seconds(1000)};
    EXPECT_EQ(pace.next("192.0.2.1"), Moment());
    for (int i = 1; i <= 601; ++i) {
        pace.count("192.0.2.1", begin);
        ASSERT_EQ(pace.next("192.0.2.1"), begin - seconds(30) + milliseconds(50) * i);
    }
    EXPECT_EQ(pace.next("192.0.2.2"), Moment());
    // After half a minute without any, all of it is there again.
    pace.count("192.0.2.1", begin + seconds(61));
    EXPECT_EQ(pace.next("192.0.2.1"), begin + seconds(31) + milliseconds(50));
    // Nothing is counted of an address that is not known yet, nor where no bound is set.
    pace.count("", begin);
    EXPECT_EQ(pace.next(""), Moment());
    indications::Pace free(0);
    free.count("192.0.2.1", begin);
    EXPECT_EQ(free.next("192.0.2.1"), Moment());
}

TEST(DeliveryTest, TriesAgainWhatMayHelp) {
    const struct {
        Step step;
        std::size_t tries;
        bool isTaken;
    } cases[] = {
        {{Answer::Taken, 200}, 1, true},    {{Answer::Nonsense, 200}, 1, true},
        {{Answer::Endless, 200}, 1, true},  {{Answer::Error, 200}, 4, false},
        {{Answer::Taken, 503}, 4, false},   {{Answer::Taken, 408}, 4, false},
        {{Answer::Taken, 400}, 1, false},   {{Answer::Taken, 401}, 1, false},
        {{Answer::Taken, 501}, 1, false},   {{Answer::Redirect, 302}, 1, false},
        {{Answer::Nothing, 200}, 4, false}, {{Answer::Never, 200}, 4, false},
    };
    for (const auto& each : cases) {
        StrictListener listener([&](std::size_t) { return each.step; });
        DeliverySettings settings = quick();
        if (each.step.answer == Answer::Never) settings.wholeTime = std::chrono::milliseconds(500);
        Delivery delivery(settings);
        delivery.add("d", listener.url(), toLoopback(), "c");
        delivery.send("d", 1, numbered);
        const DeliveryCounters counters = settled(delivery, "d", 1);
        EXPECT_EQ(counters.delivered, each.isTaken ? 1U : 0U) << each.step.status;
        EXPECT_EQ(counters.isFailing, !each.isTaken) << each.step.status;
        // Every try has the same number.
        EXPECT_EQ(listener.waitFor(each.tries), std::vector<std::string>(each.tries, numbered({"c", 0})))
            << each.step.status << ' ' << static_cast<int>(each.step.answer);
    }
}

TEST(DeliveryTest, KeepsTheOrderWhileItTriesAgainAndAfterItGaveUp) {
    // The second is not taken at first, the third never; the fourth has one try, and so has the fifth.
    StrictListener listener([](std::size_t number) {
        const bool isRefused = number == 1 || (number >= 3 && number <= 7);
        return Step{isRefused ? Answer::Error : Answer::Taken, 200};
    });
    Delivery delivery(quick());
    delivery.add("d", listener.url(), toLoopback(), "c");
    for (int i = 0; i < 5; ++i)
        delivery.send("d", 1, numbered);
    const DeliveryCounters counters = settled(delivery, "d", 5);
    EXPECT_EQ(counters.delivered, 3U);
    EXPECT_EQ(counters.givenUp, 2U);
    EXPECT_FALSE(counters.isFailing);
    std::vector<std::string> expected;
    for (const std::int64_t number : {0, 1, 1, 2, 2, 2, 2, 3, 4})
        expected.push_back(numbered({"c", number}));
    EXPECT_EQ(listener.waitFor(9), expected);
}

TEST(DeliveryTest, LosesTheOldestOfAListenerThatHangsAndNothingOfOthers) {
    StrictListener hanging([](std::size_t) { return Step{Answer::Never, 200}; });
    StrictListener listener;
    DeliverySettings settings = quick();
    settings.mostWaiting = 10;
    std::optional<Delivery> delivery(settings);
    // More than may be under way to listeners that fail; each of these hangs in its first try.
    for (int i = 0; i < 3; ++i)
        delivery->add("hangs " + std::to_string(i), hanging.url(), toLoopback(), "h" + std::to_string(i));
    delivery->add("d", listener.url(), toLoopback(), "c");
    for (int i = 0; i < 3; ++i)
        delivery->send("hangs " + std::to_string(i), 1, numbered);
    hanging.waitFor(3);
    for (int i = 0; i < 30; ++i) {
        delivery->send("hangs 0", static_cast<std::uint64_t>(i % 2), numbered);
        delivery->send("d", 1, numbered);
        settled(*delivery, "d", static_cast<std::uint64_t>(i) + 1);
    }
    EXPECT_EQ(listener.waitFor(30).size(), 30U);
    EXPECT_EQ(delivery->counters("d").overflow, 0U);
    EXPECT_EQ(delivery->counters("hangs 0").overflow, 21U);
    EXPECT_EQ(delivery->counters("hangs 0").waiting, 10U);
    // What is under way stays, of the rest the other subscription's.
    delivery->drop("hangs 0", 0);
    EXPECT_EQ(delivery->counters("hangs 0").waiting, 6U);
    delivery->remove("hangs 0");
    EXPECT_EQ(delivery->counters("hangs 0").waiting, 0U);
    const auto begin = std::chrono::steady_clock::now();
    delivery.reset();
    EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(10));
}

TEST(DeliveryTest, IsNotHeldUpByANameServerThatDoesNotAnswer) {
    StrictListener listener;
    DeliverySettings settings = quick();
    settings.connectTime = std::chrono::milliseconds(50);
    settings.retries = 0;
    Delivery delivery(settings);
    delivery.add("slow", "http://listener.slow.example:5000/", toLoopback(), "s");
    delivery.add("d", listener.url(), toLoopback(), "c");
    delivery.send("slow", 1, numbered);
    auto reached = std::async(std::launch::async, [&] {
        const bool isGivenUp = settled(delivery, "slow", 1).givenUp == 1;
        delivery.send("d", 1, numbered);
        return isGivenUp && settled(delivery, "d", 1).delivered == 1;
    });
    const bool isInTime = reached.wait_for(std::chrono::seconds(30)) == std::future_status::ready;
    g_nameServerAnswers = true;
    g_nameServerAnswers.notify_all();
    EXPECT_TRUE(isInTime);
    EXPECT_TRUE(reached.get());
}

TEST(DeliveryTest, TriesAgainWhereOneOfTwoAddressesIsAllowed) {
    const int socket = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_in place{};
    place.sin_family = AF_INET;
    place.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t size = sizeof place;
    ASSERT_EQ(::bind(socket, reinterpret_cast<sockaddr*>(&place), size), 0);
    ASSERT_EQ(::getsockname(socket, reinterpret_cast<sockaddr*>(&place), &size), 0);
    DeliverySettings settings = quick();
    settings.retries = 10'000;
    {
        Delivery delivery(settings);
        const auto onlyIpv4 =
            indications::AddressPolicy::onlyTo(std::vector{indications::networkIn("127.0.0.1").value()});
        delivery.add("d", "http://listener.dual.example:" + std::to_string(ntohs(place.sin_port)), onlyIpv4,
                     "c");
        delivery.send("d", 1, numbered);
        utils::Thread::msleep(100);
        // As a listener that starts anew; before, it refuses connections, and the other address is denied.
        ASSERT_EQ(::listen(socket, 1), 0);
        pollfd waiting{socket, POLLIN, 0};
        EXPECT_EQ(::poll(&waiting, 1, 30'000), 1);
        EXPECT_EQ(delivery.counters("d").givenUp, 0U);
    }
    ::close(socket);
}

TEST(DeliveryTest, KeepsTheBoundsOnBytes) {
    StrictListener hanging([](std::size_t) { return Step{Answer::Never, 200}; });
    DeliverySettings settings = quick();
    settings.mostBytes = 1'000;
    settings.mostBytesOfAll = 1'500;
    Delivery delivery(settings);
    const auto large = [](const auto&) { return std::string(100, 'x'); };
    for (const char* name : {"a", "b"}) {
        delivery.add(name, hanging.url(), toLoopback(), name);
        for (int i = 0; i < 20; ++i)
            delivery.send(name, 1, large);
    }
    // The first one had all it may have before the other one came.
    EXPECT_EQ(delivery.counters("a").waiting + delivery.counters("b").waiting, 15U);
    EXPECT_EQ(delivery.counters("a").overflow + delivery.counters("b").overflow, 25U);
    EXPECT_LE(delivery.counters("b").waiting, 10U);
}

TEST(DeliveryTest, ConnectsToNoAddressThatThePolicyForbids) {
    StrictListener listener;
    const std::string port = std::to_string(listener.port());
    Delivery delivery(quick());
    std::size_t added = 0;
    for (const char* spelling : {"127.0.0.1", "0x7f000001", "127.1", "2130706433", "localhost",
                                 "[::ffff:127.0.0.1]", "0", "[::1]"}) {
        const std::string name = std::to_string(added++);
        delivery.add(name, std::string("http://") + spelling + ":" + port,
                     indications::AddressPolicy::anywhere(indications::machineAddress("192.0.2.7").value()),
                     "c");
        delivery.send(name, 1, numbered);
        EXPECT_EQ(settled(delivery, name, 1).givenUp, 1U) << spelling;
    }
    EXPECT_EQ(listener.waitFor(0).size(), 0U);
}

/// A file with a key and its own certificate for the name, for two days.
std::string certificateFor(const test::TempFolder& folder, const std::string& name) {
    const std::string file = folder / "listener.pem";
    const test::ProgramResult made = test::run(
        {"/bin/sh", "-c",
         "openssl req -x509 -newkey ec -pkeyopt ec_paramgen_curve:prime256v1 -nodes -keyout $0 -out $0.crt "
         "-days 2 -subj /CN=listener -addext subjectAltName=$1 && cat $0.crt >> $0",
         file, name});
    EXPECT_EQ(made.status, 0) << made.error;
    return file;
}

TEST(DeliveryTest, TrustsCertificatesThatAnAuthorityKnowsUnderTheNameOfTheListener) {
    const struct {
        const char* name;
        bool isKnown;
        bool isVerified;
        bool isTaken;
    } cases[] = {
        {"IP:127.0.0.1", true, true, true},
        {"IP:127.0.0.1", false, true, false},
        {"IP:127.0.0.2", true, true, false},
        {"IP:127.0.0.2", false, false, true},
    };
    for (const auto& each : cases) {
        const test::TempFolder folder;
        const std::string pem = certificateFor(folder, each.name);
        StrictListener listener([](std::size_t) { return Step(); }, pem);
        DeliverySettings settings = quick();
        settings.retries = 0;
        settings.verifies = each.isVerified;
        if (each.isKnown) settings.certificates = pem + ".crt";
        Delivery delivery(settings);
        delivery.add("d", listener.url(), toLoopback(), "c");
        delivery.send("d", 1, numbered);
        EXPECT_EQ(settled(delivery, "d", 1).delivered, each.isTaken ? 1U : 0U) << each.name << each.isKnown;
        EXPECT_EQ(listener.waitFor(0).size(), each.isTaken ? 1U : 0U);
    }
}

TEST(DeliveryTest, TakesUrlsOfListenersOnly) {
    const std::string root = "http://h/";
    const std::string noUrl = "is no URL: ";
    const std::string odd = "holds a blank or a character that is none of a URL";
    const std::string secrets = "holds a name or a password, which everybody could read";
    const struct {
        std::string url;
        std::string refusal;  ///< empty for none; what curl says follows noUrl
    } cases[] = {
        {"http://h:5000", ""},
        {"https://h.example/CIMListener/x", ""},
        {"h:5000", ""},
        {"10.0.0.1:5988/a", ""},
        {"HTTP://[2001:db8::1]:5000/~!", ""},
        {root + std::string(1024 - root.size(), 'a'), ""},
        {root + std::string(1025 - root.size(), 'a'), "is longer than 1024 bytes"},
        {"", "is empty"},
        {"file:///etc/passwd", "has the scheme file"},
        {"gopher://h:70/x", "has the scheme gopher"},
        {"http://user:secret@h:5000/", secrets},
        {"http://:secret@h:5000/", secrets},
        {"http://user@h/", secrets},
        {"http://h/a b", odd},
        {"http://h/\r\nX: y", odd},
        {"http://h/\x7F", odd},
        {"http://h:99999/", noUrl},
        {"http://", noUrl},
    };
    for (const auto& each : cases) {
        std::string refusal;
        try {
            indications::requireDestination(each.url);
        } catch (const core::CimError& error) {
            EXPECT_EQ(error.status(), core::CimStatus::InvalidParameter);
            refusal = error.what();
        }
        const std::string end = "; write it as http://host:port/path or https://...";
        const bool isCurls = each.refusal == noUrl;
        const std::string expected =
            each.refusal.empty() ? "" : "Destination " + each.refusal + (isCurls ? "" : end);
        EXPECT_EQ(isCurls ? refusal.substr(0, expected.size()) : refusal, expected) << each.url;
        EXPECT_EQ(refusal.ends_with(end), !refusal.empty()) << refusal;
    }
}

}  // namespace
