// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "MidAPI/AdapterTypes.h"
#include "MidAPI/OperationFailure.h"
#include "Utils/Os/Linux/Mutex.h"

namespace ma {

/// The operations of an adapter at which a fault can strike.
enum class Operation {
    Enumerate,
    PciAddress,
    FirmwareVersion,
    Prepare,
    Write,
    CapabilityWord,
    BootType,
    Info
};

/// One thing that shall go wrong.
struct Fault {
    enum class Action {
        Fail,       ///< the operation reports failure with `code` and `text` (Prepare: `code` is the status)
        Throw,      ///< it throws AdapterError with `text`
        Stall,      ///< it takes `milliseconds` longer
        PowerLoss,  ///< it throws AdapterError and leaves the files as they are at that moment
        Kill,       ///< the process gets SIGKILL
    };

    Operation at = Operation::Write;
    Action action = Action::Fail;
    std::uint16_t percent = 0;  ///< Write only: strikes when the progress has reached this, 0 to 100
    std::uint32_t code = 0;
    std::string text{};
    std::uint32_t milliseconds = 0;
    bool once = false;  ///< strikes one time only, instead of at every such operation
};

/// The faults of one adapter. Thread-safe.
class FaultList {
  public:
    explicit FaultList(std::vector<Fault> faults);

    void add(Fault fault);
    void clear();

  private:
    friend class FaultRun;
    // Faults may be equal; the pointer tells which one was used up.
    using Entry = std::shared_ptr<const Fault>;

    std::vector<Entry> armed(Operation operation);
    /// Uses a fault up when it is a one-shot; false when another operation was faster.
    bool take(const Entry& entry);

    utils::Mutex m_mutex;
    std::vector<Entry> m_entries QUENX_GUARDED_BY(m_mutex);
};

/// The faults that may strike during one operation, each at most once.
class FaultRun {
  public:
    FaultRun(FaultList& list, Operation operation);

    /// Lets those strike whose percentage is reached. Throws OperationFailure or AdapterError.
    void reach(unsigned int percent = 100);

  private:
    FaultList& m_list;
    std::vector<FaultList::Entry> m_pending;
};

}  // namespace ma
