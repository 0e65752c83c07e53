// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "History/History.h"
#include "History/Owner.h"
#include "History/Store.h"
#include "Utils/Os/Linux/Mutex.h"

namespace history {

/// An update that has begun, as its record will be.
struct RunningUpdate {
    Record record;                ///< with id 0 while it is not in the file
    std::int64_t most = 0;        ///< records that are kept
    std::string keepFolder = {};  ///< for the image, once it was written; empty for none
};

/// What the history's own thread does: opens the file when it is first needed, writes, and completes what
/// dead processes have left. A failure is told once, until it is over, and never thrown but by find(). Used
/// by that thread alone, but for refused().
class Keeper {
  public:
    explicit Keeper(Settings settings) : m_settings(std::move(settings)) {}

    /// Takes the record of an attempt that came to nothing, for addRefused(). For any thread.
    /// @param most  how many records are kept
    /// @return whether so many are waiting that the caller should wait for them, too
    bool refused(Record record, std::int64_t most);
    /// Writes the records that refused() has taken. Any process reads them then, and they outlive this one;
    /// they are on the medium after the next sync(), or the next change that does not wait for that.
    void addRefused();
    /// Brings to the medium what is not there yet.
    void sync();
    /// Writes after those that refused() has taken. False when the record could not be written.
    bool begin(const std::shared_ptr<RunningUpdate>& update);
    /// The update did not begin after all, since its record came too late: it gets one as a refusal.
    void withdraw(const std::shared_ptr<RunningUpdate>& update);
    /// The record says how it ended, but not yet what the adapter then has.
    void end(const std::shared_ptr<RunningUpdate>& update);
    /// Copies the image of an update that has ended to where it is to be kept.
    static void keepImageOf(const RunningUpdate& update) noexcept;
    /// Completes the records of dead processes, and looks which firmware runs meanwhile.
    void look();
    /// Why nothing can be written now; empty where something was.
    std::string prove() noexcept;
    /// Notes the progress of the updates of this process, and does a sync(); false when there was nothing to
    /// do.
    bool watch();
    /// The same as look(), and then the records, those that refused() has taken included. Makes no file where
    /// there is none.
    /// Throws HistoryError.
    std::vector<Record> find(const Filter& filter);
    /// How many there are. Throws HistoryError.
    std::int64_t count();

  private:
    bool withStore(const std::function<void(Store&)>& step, bool isSyncedLater = false) noexcept;
    Store& open();
    void openFile();
    bool isThere() const;
    os::FileLock lockFolder() const;
    void replaceDamaged(const std::string& reason);
    void insert(Store& store, std::span<Record> records, std::int64_t most);
    void completeOfDead(Store& store) const;
    static void noteActive(Store& store);
    void say(const std::string& problem);

    const Settings m_settings;
    std::string m_folder;  ///< without links; empty until it was found
    std::optional<Owner> m_owner;
    std::optional<Store> m_store;
    std::vector<std::shared_ptr<RunningUpdate>> m_running;
    std::string m_problem;  ///< the last one, until it is over; the first was told
    bool m_isUnsynced = false;

    utils::Mutex m_refusedMutex;
    std::vector<Record> m_refused QUENX_GUARDED_BY(m_refusedMutex);  ///< not yet written
    std::int64_t m_mostRecords QUENX_GUARDED_BY(m_refusedMutex) = 0;
};

}  // namespace history
