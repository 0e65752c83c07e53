// SPDX-License-Identifier: Apache-2.0
#include "History/History.h"

#include <unistd.h>

#include <exception>
#include <utility>

#include "History/Keeper.h"
#include "History/Look.h"
#include "History/Owner.h"
#include "History/Place.h"
#include "History/Writer.h"
#include "MidAPI/Image/OptionRom.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/SignalsBlocked.h"
#include "Utils/Os/Linux/linux.h"
#include "Utils/Utils.h"

namespace history {

namespace {

/// How long an update waits for its record.
constexpr std::chrono::seconds kPatience{5};
/// How long somebody waits who wants to read.
constexpr std::chrono::minutes kReadingPatience{1};

/// What clients send may be as long as a request, and a history has room for many.
std::string cut(const std::string& text) {
    constexpr std::size_t kMost = 2000;
    return utils::shortened(text, kMost);
}

std::string joinedNumbers(const std::vector<std::uint16_t>& numbers) {
    std::vector<std::string> texts;
    for (const std::uint16_t number : numbers)
        texts.push_back(std::to_string(number));
    return utils::joined(texts, ",");
}

std::string joinedNames(const std::vector<utils::FirmwareType>& types) {
    std::vector<std::string> names;
    for (const utils::FirmwareType type : types)
        names.emplace_back(ma::firmwareTypeName(type));
    return utils::joined(names, "+");
}

Record recordOf(const core::UpdateAttempt& attempt) {
    const core::Caller& caller = attempt.caller;
    Record record;
    record.begun = static_cast<std::int64_t>(attempt.time);
    record.user = caller.principal.empty() ? std::to_string(::getuid()) : caller.principal;
    record.address = caller.address;
    record.front = caller.front;
    record.process = ::getpid();
    record.boot = bootId();
    record.host = os::getHostname();
    record.target = cut(attempt.target);
    record.adapter = attempt.adapter;
    record.uri = cut(attempt.uri);
    record.sha256 = attempt.image.sha256;
    record.signedBy = attempt.signedBy;
    if (!attempt.image.sha256.empty()) record.bytes = static_cast<std::int64_t>(attempt.image.bytes);
    record.imageVersions = attempt.image.versions;
    record.types = joinedNames(attempt.types);
    record.options = cut(joinedNumbers(attempt.options));
    record.optionValues = cut(utils::joined(attempt.values, ","));
    record.job = attempt.job;
    return record;
}

void finish(Record& record, std::uint64_t since) {
    record.ended = static_cast<std::int64_t>(os::getuSecondsSinceEpoch());
    record.duration = static_cast<std::int64_t>(os::getMonotonicuSeconds() - since);
}

}  // namespace

/// What belongs to one process. A child that was forked since has no such thread, and SQLite, whose locks no
/// child inherits, would not know that it holds none.
struct History::Process {
    explicit Process(const Settings& settings)
        : keeper(std::make_shared<Keeper>(settings)),
          writer([held = keeper] { return held->watch(); }, [held = keeper] { held->addRefused(); }) {}
    Process(const Process&) = delete;
    Process& operator=(const Process&) = delete;
    ~Process() {
        writer.run(
            [held = keeper] {
                held->addRefused();
                held->sync();
            },
            {});
    }

    const pid_t id = ::getpid();
    const std::shared_ptr<Keeper> keeper;
    Writer writer;  // last: it uses the other
};

class History::Update : public core::UpdateRecord {
  public:
    Update(Process& process, std::shared_ptr<RunningUpdate> update, std::uint64_t since)
        : m_process(process), m_update(std::move(update)), m_since(since) {}
    ~Update() override {
        if (!m_hasEnded)
            finishAs(kFailed, core::ReasonId::WorkerNotStarted, 0, "The update did not take place");
    }

    void end(bool succeeded, std::uint32_t code, const std::string& text) noexcept override {
        m_hasEnded = true;
        if (succeeded)
            finishAs(kWritten, core::ReasonId::None, code, text);
        else
            finishAs(kFailed, core::reasonOfErrorCode(code), code, text);
    }

    /// It does not begin. Waits for nothing.
    void withdraw() {
        m_hasEnded = true;
        m_process.writer.run([keeper = m_process.keeper, update = m_update] { keeper->withdraw(update); },
                             {});
    }

  private:
    void finishAs(const char* outcome, core::ReasonId reason, std::uint32_t code,
                  const std::string& text) noexcept try {
        // By value, since the task may run when nobody waits for it any more.
        const auto task = [keeper = m_process.keeper, update = m_update, since = m_since, outcome, reason,
                           code, text] {
            Record& record = update->record;
            record.outcome = outcome;
            record.errorCode = code;
            record.reason = cut(text);
            record.reasonId = core::reasonCode(reason);
            if (record.outcome == kWritten) record.percent = 100;
            finish(record, since);
            keeper->end(update);
        };
        m_process.writer.run(task, kPatience);
        // Nobody waits for that: the image may be large.
        const bool isKept = outcome == std::string_view(kWritten) && !m_update->keepFolder.empty();
        if (isKept) m_process.writer.run([update = m_update] { Keeper::keepImageOf(*update); }, {});
    } catch (const std::exception&) {
        // Without memory the record stays as it is, and the next start completes it.
    }

    Process& m_process;
    const std::shared_ptr<RunningUpdate> m_update;
    const std::uint64_t m_since;
    bool m_hasEnded = false;
};

History::History(Settings settings) : m_settings(std::move(settings)) {}

std::shared_ptr<History> History::wanted() {
    return isWanted() ? std::make_shared<History>() : nullptr;
}

History::~History() {
    Process* const own = m_process.load();
    // A parent's cannot be destroyed here: its thread is not in this process.
    if (own != nullptr && own->id == ::getpid()) delete own;
}

History::Process& History::process() {
    Process* known = m_process.load();
    if (known != nullptr && known->id != ::getpid()) {
        if (!m_isForkTold.exchange(true))
            utils::writeAuditLog(
                "[history] No record is kept of updates: this process was forked from one that "
                "keeps the history");
        throw HistoryError("this process was forked from one that keeps it");
    }
    if (known != nullptr) return *known;
    auto made = std::make_unique<Process>(m_settings);
    return m_process.compare_exchange_strong(known, made.get()) ? *made.release() : *known;
}

std::future<core::ImageFacts> History::examine(std::span<const std::uint8_t> file) noexcept try {
    constexpr std::size_t kWorthAThread = std::size_t{256} << 10;
    const bool isSmall = file.size() < kWorthAThread;
    const utils::SignalsBlocked blocked;
    return std::async(isSmall ? std::launch::deferred : std::launch::async, [file] { return factsOf(file); });
} catch (const std::exception&) {
    return {};
}

void History::refused(const core::UpdateAttempt& attempt, unsigned int returnValue, core::ReasonId reason,
                      const std::string& text) noexcept try {
    Record record = recordOf(attempt);
    record.outcome = kRefused;
    record.reason = cut(text);
    record.reasonId = core::reasonCode(reason);
    if (returnValue != 0) record.returnValue = returnValue;
    finish(record, attempt.monotonic);
    Process& own = process();
    // Nobody waits for it: the answer says what was refused, and the audit trail has it at once. Whoever
    // refuses faster than the disk takes records waits for the disk.
    if (own.keeper->refused(std::move(record), attempt.mostRecords))
        own.writer.run([keeper = own.keeper] { keeper->addRefused(); }, kPatience);
    else
        own.writer.gather();
} catch (const std::exception&) {
    // Without memory there is no record; the other reason has been told.
}

std::shared_ptr<core::UpdateRecord> History::begin(const core::UpdateAttempt& attempt) noexcept try {
    auto update = std::make_shared<RunningUpdate>(
        RunningUpdate{recordOf(attempt), attempt.mostRecords, attempt.keepFolder});
    update->record.outcome = kRunning;
    update->record.percent = 0;
    Process& own = process();
    auto record = std::make_shared<Update>(own, update, attempt.monotonic);
    const auto isKept = std::make_shared<std::atomic<bool>>(false);
    own.writer.run([keeper = own.keeper, update, isKept] { *isKept = keeper->begin(update); }, kPatience);
    if (!attempt.mustBeKept || *isKept) return record;
    record->withdraw();
    return nullptr;
} catch (const std::exception&) {
    return nullptr;
}

std::string History::problem() try {
    const auto answer = std::make_shared<std::string>();
    Process& own = process();
    const auto task = [keeper = own.keeper, answer] { *answer = keeper->prove(); };
    return own.writer.run(task, kPatience) ? *answer : "the disk does not answer";
} catch (const HistoryError& error) {
    return error.what();
}

void History::look() {
    Process& own = process();
    own.writer.run([keeper = own.keeper] { keeper->look(); }, {});
}

template <class Answer>
Answer History::ask(std::function<Answer(Keeper&)> question) {
    struct Shared {
        Answer answer{};
        std::exception_ptr error;
    };
    const auto shared = std::make_shared<Shared>();
    Process& own = process();
    const auto task = [keeper = own.keeper, question = std::move(question), shared] {
        try {
            shared->answer = question(*keeper);
        } catch (...) {
            shared->error = std::current_exception();
        }
    };
    if (!own.writer.run(task, kReadingPatience)) throw HistoryError("the disk does not answer");
    if (shared->error) std::rethrow_exception(shared->error);
    return std::move(shared->answer);
}

std::vector<Record> History::find(const Filter& filter) {
    return ask<std::vector<Record>>([filter](Keeper& keeper) { return keeper.find(filter); });
}

std::int64_t History::count() {
    return ask<std::int64_t>([](Keeper& keeper) { return keeper.count(); });
}

}  // namespace history
