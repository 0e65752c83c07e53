// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <utility>

#include "Providers/Schema/ProviderInterfaces.h"
#include "Utils/Os/Linux/Mutex.h"

/// A hold on the one adapter that may be serviced at a time. Verification takes it, the job owns it.
///
/// Destroying a claim gives nothing back: an adapter whose check succeeded, or whose update ended in a way
/// that nobody foresaw, stays out of use until the process ends, or somebody frees it who may. Whoever gives
/// an adapter back says so.
class AdapterClaim {
  public:
    using Serviced = utils::Atomic<std::string>;

    /// Not taken yet.
    /// @param serviced  the name of the adapter that is serviced, empty when none is; outlives the claim
    explicit AdapterClaim(Serviced& serviced) : m_serviced(&serviced) {}
    AdapterClaim(AdapterClaim&& other) noexcept
        : m_serviced(other.m_serviced),
          m_adapterName(std::exchange(other.m_adapterName, {})),
          m_number(other.m_number) {}
    AdapterClaim& operator=(AdapterClaim&& other) noexcept {
        std::swap(m_serviced, other.m_serviced);
        m_adapterName.swap(other.m_adapterName);
        std::swap(m_number, other.m_number);
        return *this;
    }
    ~AdapterClaim() { leave(); }

    /// Takes the adapter, testing and taking in one step, and notes the thread's caller. Throws ETargetInUse
    /// when it is being serviced already, EJobIsRunning when another one is.
    void take(std::string adapterName);
    /// Notes that a job needs the adapter from now on.
    void passTo(std::string job) noexcept;
    /// No adapter is serviced any more, whoever took it.
    void release() noexcept;
    /// Gives back what was taken, where the policy or the configuration wants that.
    void releaseIfConfigured() noexcept;
    /// The same for whoever has only the adapter's name; nothing happens while another adapter is serviced.
    static void releaseIfConfigured(Serviced& serviced, const std::string& adapterName) noexcept;

    /// Who holds the serviced adapter, and for what.
    static update::Claim current(const Serviced& serviced);
    /// Frees the adapter from a claim whose owner has gone, and from no other.
    static update::ClaimRelease releaseLeft(Serviced& serviced, const std::string& adapterName);

  private:
    void leave() noexcept;

    Serviced* m_serviced;
    std::string m_adapterName;   ///< empty while nothing is taken
    std::uint64_t m_number = 0;  ///< tells this claim from later ones on the same adapter
};
