// SPDX-License-Identifier: Apache-2.0
#include "MidAPI/Devlink/FlashRun.h"

#include <algorithm>
#include <cerrno>
#include <system_error>

#include "MidAPI/Devlink/FlashWatch.h"
#include "MidAPI/Devlink/StagedImage.h"
#include "MidAPI/OperationFailure.h"
#include "Utils/Log.h"

namespace ma::devlink {
namespace {

[[noreturn]] void fail(int error, const std::string& text) {
    throw OperationFailure(static_cast<std::uint32_t>(error), text);
}

/// Names and values of what is in the flash, for a comparison; empty where the driver does not tell.
std::string storedVersions(DevlinkConnection& connection, const std::string& address) {
    const Answer answer = askInfo(connection, address);
    if (answer.isLost || answer.result.error != 0) return {};
    std::string stored;
    for (const NamedVersion& version : readDeviceInfo(answer.attributes).versions)
        if (!version.stored.empty())
            stored += (stored.empty() ? "" : ", ") + version.name + ' ' + version.stored;
    return stored;
}

/// What a user can do about an error of the kernel's.
std::string advice(int error) {
    switch (error) {
        case ENOENT:
            return ". The kernel looks for the file in the machine's own folders: outside a container it "
                   "finds it";
        case EPERM:
            return ". Flashing takes the capability CAP_NET_ADMIN in the machine's own user namespace: run "
                   "it as root";
        case ENODEV:
            return ". The device is gone, or in another network namespace";
        default:
            return {};
    }
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
    void flashOne(const std::string& component) {
        const std::string before = storedVersions(m_connection, m_address);
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
            refuse(answer, watch.lastText());
        m_progress.partDone();
    }

  private:
    [[noreturn]] static void refuse(const Answer& answer, const std::string& lastText) {
        std::string text = "the update failed: " + describe(answer);
        if (answer.result.text.empty() && !lastText.empty())
            text += "; the driver's last words were: " + lastText;
        fail(answer.result.error, text + advice(answer.result.error));
    }

    /// Nobody has told how the flash ended, but what is stored does, where it has changed.
    void resolve(const std::string& before) {
        DevlinkConnection fresh(m_machine);  // the old one may be the reason
        const std::string after = storedVersions(fresh, m_address);
        if (!after.empty() && after != before) {
            QUENX_ERROR(
                "adapter %s: the kernel did not tell how the update ended, but the flash now holds %s",
                m_address.c_str(), after.c_str());
            return;
        }
        fail(ETIMEDOUT, "the kernel did not tell how the update ended, and " +
                            (after.empty() ? "the driver does not tell what is in the flash"
                                           : "the flash holds " + after + ", as before") +
                            "; look at the adapter's versions, and update it again");
    }

    Machine& m_machine;
    DevlinkConnection m_connection;
    const std::string m_address;
    const StagedImage m_staged;
    FlashProgress m_progress;
    const std::function<void()>& m_onStatus;
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
