// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <utility>

#include "Utils/Os/Linux/Mutex.h"

/// A hold on the one adapter that may be serviced at a time. Verification takes it, the job owns it.
///
/// Destroying a claim gives nothing back: an adapter whose check succeeded, or whose update ended in a way
/// that nobody foresaw, stays out of use until the process ends. Whoever gives an adapter back says so.
class AdapterClaim {
  public:
    /// Not taken yet.
    /// @param serviced  the name of the adapter that is serviced, empty when none is; outlives the claim
    explicit AdapterClaim(utils::Atomic<std::string>& serviced) : m_serviced(&serviced) {}
    AdapterClaim(AdapterClaim&& other) noexcept
        : m_serviced(other.m_serviced), m_adapterName(std::exchange(other.m_adapterName, {})) {}
    AdapterClaim& operator=(AdapterClaim&& other) noexcept {
        m_serviced = other.m_serviced;
        m_adapterName = std::exchange(other.m_adapterName, {});
        return *this;
    }
    ~AdapterClaim() = default;

    /// Takes the adapter, testing and taking in one step. Throws ETargetInUse when it is being serviced
    /// already, EJobIsRunning when another one is.
    void take(std::string adapterName);
    /// No adapter is serviced any more, whoever took it.
    void release() noexcept;
    /// Gives back what was taken, where the configuration wants that (ReleaseClaimAfterCheck).
    void releaseIfConfigured() noexcept;
    /// The same for whoever has only the adapter's name; nothing happens while another adapter is serviced.
    static void releaseIfConfigured(utils::Atomic<std::string>& serviced,
                                    const std::string& adapterName) noexcept;

  private:
    utils::Atomic<std::string>* m_serviced;
    std::string m_adapterName;  ///< empty while nothing is taken
};
