// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/FlashRun.h"

#include <algorithm>
#include <cerrno>
#include <system_error>

#include "MidAPI/Devlink/FlashWatch.h"
#include "MidAPI/Devlink/StagedImage.h"
#include "MidAPI/OperationFailure.h"
#include "Utils/Log.h"
#include "Utils/Utils.h"

namespace ma::devlink {
namespace {

[[noreturn]] void fail(int error, const std::string& text) {
    throw OperationFailure(codeOf(error), text);
}

/// Names and values of what is in the flash, for a comparison; empty where the driver does not tell.
std::string storedVersions(const ToldInfo& told) {
    std::string stored;
    for (const NamedVersion& version : told.info.versions)
        if (!version.stored.empty())
            stored += (stored.empty() ? "" : ", ") + version.name + ' ' + version.stored;
    return stored;
}

/// One update: the flashes of one image.
class FlashRun {
  public:
    FlashRun(Machine& machine, const FlashOrder& order, const std::function<void()>& onStatus)
        : m_machine(machine),
          m_connection(machine),
          m_address(order.function.pci.address),
          m_staged(machine, order.folder, order.function.pci.card(), order.image),
          m_progress(*order.function.progress, std::max<std::size_t>(order.components.size(), 1)),
          m_onStatus(onStatus) {}

    void requireDevlink() const {
        if (m_connection.family().number == 0) fail(ENODEV, "this kernel has no devlink any more");
    }

    /// @param component  empty for the whole device
    void flashOne(const std::string& component) try {
        const ToldInfo before = askInfo(m_connection, m_address);
        // Listening before the request: what is told meanwhile is told once.
        FlashWatch watch(m_machine, m_connection.family(), m_address, [this](const FlashStatus& status) {
            m_progress.report(status);
            m_onStatus();
        });
        const Answer answer = flash(m_connection, m_address, m_staged.name(), component);
        watch.finish();
        if (answer.isLost)
            resolve(before);
        else if (answer.result.error != 0)
            refuse(component, answer, watch.lastText());
        m_progress.partDone();
        m_written.push_back(component);
    } catch (const std::system_error& error) {
        fail(error.code().value(), whatFailed(component) + error.what() + whatIsLeft());
    }

  private:
    [[noreturn]] void refuse(const std::string& component, const Answer& answer,
                             const std::string& lastText) const {
        std::string text = whatFailed(component) + describe(answer);
        if (answer.result.text.empty() && !lastText.empty())
            text += "; the driver's last words were: " + lastText;
        fail(answer.result.error, text + whatIsLeft());
    }

    static std::string whatFailed(const std::string& component) {
        return component.empty() ? "the update failed: " : "the update of " + component + " failed: ";
    }

    /// What a failure has left in the flash.
    std::string whatIsLeft() const {
        return whatIsStored(askInfoAnew(m_machine, m_address)) +
               (m_written.empty() ? "" : "; before it " + utils::joined(m_written) + " was written");
    }

    static std::string whatIsStored(const ToldInfo& told) {
        if (!told.error.empty()) return "; what is in the flash cannot be read: " + told.error;
        const std::string stored = storedVersions(told);
        return stored.empty() ? "; the driver does not tell what is in the flash"
                              : "; the flash holds " + stored;
    }

    /// Nobody has told how the flash ended, but what is stored does, where it has changed.
    void resolve(const ToldInfo& before) const {
        const ToldInfo now = askInfoAnew(m_machine, m_address);
        const std::string after = storedVersions(now);
        const std::string stored = storedVersions(before);
        // What was not known before has not changed by being known now.
        if (!stored.empty() && !after.empty() && after != stored) {
            QUENX_ERROR(
                "adapter %s: the kernel did not tell how the update ended, but the flash now holds %s",
                m_address.c_str(), after.c_str());
            return;
        }
        fail(ETIMEDOUT, "the kernel did not tell how the update ended" + whatIsStored(now) +
                            (after.empty() || after != stored ? "" : ", as before") +
                            "; look at the adapter's versions, and update it again");
    }

    Machine& m_machine;
    DevlinkConnection m_connection;
    const std::string m_address;
    const StagedImage m_staged;
    FlashProgress m_progress;
    const std::function<void()>& m_onStatus;
    std::vector<std::string> m_written;
};

}  // namespace

void runFlash(Machine& machine, const FlashOrder& order, const std::function<void()>& onStatus) try {
    FlashRun run(machine, order, onStatus);
    run.requireDevlink();
    if (order.components.empty()) return run.flashOne("");
    for (const std::string& component : order.components)
        run.flashOne(component);
} catch (const std::system_error& error) {
    fail(error.code().value(), error.what());
}

}  // namespace ma::devlink
