// SPDX-License-Identifier: Apache-2.0
#include "Indications/Delivery/Delivery.h"

#include <algorithm>
#include <map>
#include <mutex>
#include <vector>

#include "Indications/Delivery/Pace.h"
#include "Indications/Delivery/Transfer.h"
#include "Utils/Exception.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/Thread.h"

namespace indications {

namespace {

using control::curl;
using control::CurlLibrary;

constexpr std::size_t kMostTransfers = 16;
/// To those that have not taken the last one, or none yet: each may take all the time there is.
constexpr std::size_t kMostToUnproven = 8;

using Multi = std::unique_ptr<CURLM, decltype(CurlLibrary::multiCleanup)>;

Multi newMulti() {
    static const CURLcode prepared = curl().globalInit(CURL_GLOBAL_DEFAULT);
    Multi multi(prepared == CURLE_OK ? curl().multiInit() : nullptr, curl().multiCleanup);
    if (multi == nullptr) throw std::bad_alloc();
    return multi;
}

/// A listener, and what is to be brought there.
struct Target {
    std::string url;
    AddressPolicy policy;
    Queue queue;
    std::string address = {};  ///< where it was last
    std::uint64_t toldOverflow = 0;
    Clock::time_point toldAt = {};
};

}  // namespace

/// The thread, and what it shares with others.
class Delivery::Courier : public utils::Thread {
  public:
    explicit Courier(DeliverySettings settings) : m_settings(std::move(settings)), m_multi(newMulti()) {}
    ~Courier() override {
        requestStop();
        wake();
        shutdown();
        for (const UnderWay& each : m_underWay)
            curl().multiRemoveHandle(m_multi.get(), each.transfer->handle());
    }

    void execute() override;

    /// Calls with the target of the name, if there is one, and has the thread look at it.
    template <class Call>
    void with(const std::string& destination, const Call& call) {
        {
            const std::lock_guard lock(m_mutex);
            const auto found = m_targets.find(destination);
            if (found == m_targets.end()) return;
            call(found->second->queue);
            makeRoom();
        }
        wake();
    }

    void add(const std::string& destination, std::shared_ptr<Target> target) {
        const std::lock_guard lock(m_mutex);
        m_targets[destination] = std::move(target);
    }
    void remove(const std::string& destination) {
        const std::lock_guard lock(m_mutex);
        m_targets.erase(destination);
    }

    DeliveryCounters counters(const std::string& destination) const {
        const std::lock_guard lock(m_mutex);
        const auto found = m_targets.find(destination);
        return found == m_targets.end() ? DeliveryCounters() : found->second->queue.counters();
    }

    const DeliverySettings& settings() const { return m_settings; }

  private:
    struct UnderWay {
        std::string destination;
        std::shared_ptr<Target> target;  ///< which may have been removed meanwhile
        std::unique_ptr<Transfer> transfer;
        bool toUnproven = false;
    };

    void wake() noexcept { curl().multiWakeup(m_multi.get()); }
    void makeRoom();
    void tellOverflow();
    void beginDue();
    /// Whether something is under way there now that was not before.
    bool begin(const std::string& destination, const std::shared_ptr<Target>& target);
    void endDone();
    void end(UnderWay& done, CURLcode code);
    int pause() const;

    const DeliverySettings m_settings;
    const Multi m_multi;
    mutable std::mutex m_mutex;  ///< for the targets and their queues; held for moments
    std::map<std::string, std::shared_ptr<Target>> m_targets;
    Pace m_pace{m_settings.perSecond};
    // The thread's own.
    std::vector<UnderWay> m_underWay;
    std::string m_last;  ///< to which something was sent
};

/// Where all together is too much, the longest queue pays for it.
void Delivery::Courier::makeRoom() {
    while (true) {
        std::size_t all = 0;
        Queue* longest = nullptr;
        for (const auto& [name, target] : m_targets) {
            all += target->queue.bytes();
            if (longest == nullptr || target->queue.bytes() > longest->bytes()) longest = &target->queue;
        }
        if (all <= m_settings.mostBytesOfAll || !longest->dropOldest()) return;
    }
}

bool Delivery::Courier::begin(const std::string& destination, const std::shared_ptr<Target>& target) {
    const bool isUnproven = !target->queue.isReliable();
    const auto unproven = std::ranges::count_if(m_underWay, [](const auto& each) { return each.toUnproven; });
    if (isUnproven && static_cast<std::size_t>(unproven) >= kMostToUnproven) return false;
    if (m_pace.next(target->address) > Clock::now()) return false;
    const Message* const message = target->queue.begin(Clock::now());
    if (message == nullptr) return false;
    try {
        auto transfer = std::make_unique<Transfer>(target->url, target->policy, message->body, m_settings);
        m_underWay.push_back({destination, target, std::move(transfer), isUnproven});
        if (curl().multiAddHandle(m_multi.get(), m_underWay.back().transfer->handle()) == CURLM_OK)
            return true;
        m_underWay.pop_back();
    } catch (const std::exception& error) {
        QUENX_ERROR("An indication could not be sent: %s", error.what());
    }
    target->queue.end(Outcome::Failed, m_settings, Clock::now());
    return false;
}

/// At most once a minute for each, with all that has come together.
void Delivery::Courier::tellOverflow() {
    constexpr std::chrono::minutes kRest{1};
    std::vector<std::pair<std::string, std::uint64_t>> lost;
    {
        const std::lock_guard lock(m_mutex);
        const auto now = Clock::now();
        for (const auto& [name, target] : m_targets) {
            const std::uint64_t overflow = target->queue.counters().overflow;
            const bool isRested = target->toldOverflow == 0 || now - target->toldAt >= kRest;
            if (overflow == target->toldOverflow || !isRested) continue;
            lost.emplace_back(name, overflow - target->toldOverflow);
            target->toldOverflow = overflow;
            target->toldAt = now;
        }
    }
    for (const auto& [name, count] : lost) {
        QUENX_ERROR("Too much waits for the destination '%s': its %llu oldest indications are lost",
                    utils::escapeForFormat(name).c_str(), static_cast<unsigned long long>(count));
    }
}

void Delivery::Courier::beginDue() {
    const std::lock_guard lock(m_mutex);
    // From the one after the last, so that each has its turn.
    auto next = m_targets.upper_bound(m_last);
    for (std::size_t i = 0; i < m_targets.size() && m_underWay.size() < kMostTransfers; ++i, ++next) {
        if (next == m_targets.end()) next = m_targets.begin();
        if (begin(next->first, next->second)) m_last = next->first;
    }
}

void Delivery::Courier::end(UnderWay& done, CURLcode code) {
    const Transfer::Result result = done.transfer->result(code);
    bool wasFailing = false;
    bool isFailing = false;
    {
        const std::lock_guard lock(m_mutex);
        done.target->address = done.transfer->address();
        m_pace.count(done.target->address, Clock::now());
        Queue& queue = done.target->queue;
        wasFailing = queue.counters().isFailing;
        queue.end(result.outcome, m_settings, Clock::now());
        isFailing = queue.counters().isFailing;
    }
    // Once for each change: a listener that is gone would fill the log.
    if (isFailing && !wasFailing) {
        QUENX_ERROR("Indications do not reach the destination '%s': %s",
                    utils::escapeForFormat(done.destination).c_str(),
                    utils::escapeForFormat(result.problem).c_str());
    } else if (wasFailing && !isFailing) {
        QUENX_ERROR("Indications reach the destination '%s' again",
                    utils::escapeForFormat(done.destination).c_str());
    }
}

void Delivery::Courier::endDone() {
    int left = 0;
    while (const CURLMsg* message = curl().multiInfoRead(m_multi.get(), &left)) {
        if (message->msg != CURLMSG_DONE) continue;
        CURL* const handle = message->easy_handle;
        const CURLcode code = message->data.result;
        const auto found = std::ranges::find_if(
            m_underWay, [&](const UnderWay& each) { return each.transfer->handle() == handle; });
        curl().multiRemoveHandle(m_multi.get(), handle);
        end(*found, code);
        m_underWay.erase(found);
    }
}

/// Until the next try is due, in milliseconds. libcurl returns earlier for what is under way.
int Delivery::Courier::pause() const {
    constexpr auto kLongest = std::chrono::milliseconds(60'000);
    const std::lock_guard lock(m_mutex);
    auto shortest = kLongest;
    const auto now = Clock::now();
    for (const auto& [name, target] : m_targets) {
        auto due = target->queue.due();
        if (due) due = std::max(*due, m_pace.next(target->address));
        // What is due already waits for a transfer to end.
        if (due && *due > now)
            shortest = std::min(shortest, std::chrono::ceil<std::chrono::milliseconds>(*due - now));
    }
    return static_cast<int>(shortest.count());
}

void Delivery::Courier::execute() {
    std::optional<Clock::time_point> deadline;
    while (true) {
        if (isStopRequested() && !deadline) deadline = Clock::now() + m_settings.farewellTime;
        if (deadline && (m_underWay.empty() || Clock::now() >= *deadline)) return;
        tellOverflow();
        if (!deadline) beginDue();
        int running = 0;
        curl().multiPerform(m_multi.get(), &running);
        const std::size_t before = m_underWay.size();
        endDone();
        if (m_underWay.size() != before) continue;  // there may be a next one
        curl().multiPoll(m_multi.get(), nullptr, 0, deadline ? 10 : pause(), nullptr);
    }
}

Delivery::Delivery(DeliverySettings settings) : m_courier(std::make_unique<Courier>(std::move(settings))) {
    m_courier->start();
}

Delivery::~Delivery() = default;

void Delivery::add(const std::string& destination, const std::string& url, const AddressPolicy& policy,
                   const std::string& context) {
    m_courier->add(destination, std::make_shared<Target>(Target{url, policy, Queue(context)}));
}

void Delivery::remove(const std::string& destination) {
    m_courier->remove(destination);
}

void Delivery::send(const std::string& destination, std::uint64_t tag, const Body& body) {
    m_courier->with(destination, [&](Queue& queue) { queue.add(tag, body, m_courier->settings()); });
}

void Delivery::drop(const std::string& destination, std::uint64_t tag) {
    m_courier->with(destination, [&](Queue& queue) { queue.drop(tag); });
}

DeliveryCounters Delivery::counters(const std::string& destination) const {
    return m_courier->counters(destination);
}

}  // namespace indications
