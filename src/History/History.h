// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "Framework/Requests/UpdateSink.h"
#include "History/Place.h"
#include "History/Record.h"
#include "History/Store.h"

namespace history {

class Keeper;

struct Settings {
    std::function<std::string()> folder = chooseFolder;  ///< asked when it is first needed
};

/// The history of updates: keeps each attempt in a file that outlives the process. An update waits a few
/// seconds at most for its record, and takes place also where it cannot be kept, which the log then says
/// once. The file is opened when it is first needed, by a thread of its own; a child that is forked after
/// that keeps nothing. Thread-safe.
class History : public core::UpdateSink {
  public:
    explicit History(Settings settings = {});
    /// Null where none is wanted.
    static std::shared_ptr<History> wanted();
    /// Waits a bounded time for what is still to be written.
    ~History() override;

    std::future<core::ImageFacts> examine(std::span<const std::uint8_t> file) noexcept override;
    void refused(const core::UpdateAttempt& attempt, unsigned int returnValue, core::ReasonId reason,
                 const std::string& text) noexcept override;
    std::string problem() override;
    std::shared_ptr<core::UpdateRecord> begin(const core::UpdateAttempt& attempt) noexcept override;

    /// Completes the records of processes that died in an update, and notes which firmware runs by now; does
    /// not wait for it. Throws as find() in a child.
    void look();
    /// The records, after such a look. Throws HistoryError.
    std::vector<Record> find(const Filter& filter);
    /// How many there are. Throws HistoryError.
    std::int64_t count();

  private:
    struct Process;
    class Update;

    Process& process();
    /// What the keeper answers, on its thread.
    template <class Answer>
    Answer ask(std::function<Answer(Keeper&)> question);

    const Settings m_settings;
    std::atomic<Process*> m_process{nullptr};
    std::atomic<bool> m_isForkTold{false};
};

}  // namespace history
