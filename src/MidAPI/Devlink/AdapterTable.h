// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "MidAPI/Devlink/DeviceRequests.h"
#include "MidAPI/Devlink/Machine.h"
#include "MidAPI/Devlink/PciFunctions.h"
#include "MidAPI/Progress.h"
#include "Utils/Export.h"
#include "Utils/Os/Linux/Mutex.h"
#include "Utils/StringArray.h"

namespace ma::devlink {

/// What is known of one PCI function.
struct KnownFunction {
    PciFunction pci;
    FlashVerdict flash;  ///< Flashable::Unknown also until the device could be asked
    DeviceInfo info;
    std::string infoError;          ///< why the driver's versions cannot be read; empty where they can
    bool offersActivation = false;  ///< the driver can put new firmware in force while the machine runs
    std::string writer;             ///< who is flashing it, or its card, for a person; empty for nobody
    std::shared_ptr<Progress> progress = std::make_shared<Progress>();  ///< never null
};

/// Whether two functions are on one card: by their places on the bus, or by what the board says of itself.
bool areOnOneCard(const KnownFunction& left, const KnownFunction& right);

/// What is known of the machine's Ethernet functions. Kept in memory, because a device that is being flashed
/// answers nothing until that is over, minutes later: it is asked when it is first looked at and after
/// whatever changed it or its card, but never while it is known to be flashed. Any thread may call.
class QUENX_EXPORT AdapterTable {
  public:
    /// @param lockFolder  where the locks of the cards are, see CardLock
    AdapterTable(std::shared_ptr<Machine> machine, std::string lockFolder);

    /// The names of the functions that the machine has now, by ascending address; the last ones that were
    /// found where they cannot be listed now. @throws AdapterError where they never could
    utils::StringArray names();
    /// True for a name that there was at some time: what it says of the function's place then holds.
    bool hasSeen(const std::string& name);

    enum class Ask {
        WhenOutOfDate,  ///< and it does not wait
        Anew,           ///< likewise, whatever is known
        AnewAsHolder,   ///< likewise, and whoever calls holds the card's lock
        Never,
    };
    /// What is known of a function; nothing for an unknown name.
    /// @throws AdapterError as names()
    std::optional<KnownFunction> find(const std::string& name, Ask ask = Ask::WhenOutOfDate);
    /// From memory alone: for what is asked again and again during an update.
    std::shared_ptr<Progress> progressOf(const std::string& name);

    /// The function of the same card that somebody flashes who does not take the card's lock, as the kernel
    /// has told; empty where there is none.
    std::string findFlashedElsewhere(const KnownFunction& function);

    /// Takes note of what the kernel has told meanwhile, so that it does not get too much for its buffer.
    void readNotifications() noexcept;

    /// Says that this process is flashing a function, for as long as it lives.
    class QUENX_EXPORT FlashScope {
      public:
        FlashScope(AdapterTable& table, std::string name);
        FlashScope(const FlashScope&) = delete;
        FlashScope& operator=(const FlashScope&) = delete;
        ~FlashScope();

      private:
        AdapterTable& m_table;
        const std::string m_name;
    };

  private:
    struct Entry {
        KnownFunction known;
        bool isOutOfDate = true;
        bool isFlashedElsewhere = false;  ///< as far as the kernel has told
        int ownFlashes = 0;
        unsigned int changes = 0;  ///< how often something was told that makes it out of date
    };
    struct Found {
        KnownFunction known;
        bool mustBeAsked = false;
        unsigned int changes = 0;
    };

    std::optional<Found> look(const std::string& name);
    std::optional<utils::StringArray> walk();
    void ask(const std::string& name, const Found& found);
    void askDevice(KnownFunction& known);
    void listen(const Family& family);
    std::string findLockHolder(const PciFunction& function);
    void note(const Notifications::Batch& batch) QUENX_REQUIRES(m_mutex);
    static void outdate(Entry& entry);
    void outdateCard(const KnownFunction& function) QUENX_REQUIRES(m_mutex);

    const std::shared_ptr<Machine> m_machine;
    const std::string m_lockFolder;
    utils::Mutex m_mutex;  ///< never held over a request
    std::map<std::string, Entry> m_entries QUENX_GUARDED_BY(m_mutex);
    utils::StringArray m_names QUENX_GUARDED_BY(m_mutex);  ///< as they were listed last
    std::set<std::string> m_seen QUENX_GUARDED_BY(m_mutex);
    std::unique_ptr<Notifications> m_notifications QUENX_GUARDED_BY(m_mutex);
};

}  // namespace ma::devlink
