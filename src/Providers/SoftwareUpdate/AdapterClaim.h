#pragma once

#include <string>

/// One request's hold on the one adapter that may be serviced at a time
/// (Quenx_ConcreteJob::m_servicedAdapter).
///
/// A refusal releases the claim before it is thrown; an accepted image keeps it, for the job or, after a
/// check, for nobody. Any other failure leaves it taken: the adapter is then in an unknown state and stays
/// out of use (intended), unless the configuration asks for its release.
class AdapterClaim {
  public:
    /// Takes the claim, testing and taking in one step. Throws ETargetInUse when the adapter has it already,
    /// EJobIsRunning when another one has.
    explicit AdapterClaim(const std::string& adapterName);
    ~AdapterClaim();
    AdapterClaim(const AdapterClaim&) = delete;
    AdapterClaim& operator=(const AdapterClaim&) = delete;

    void release() noexcept;
    /// The claim is no longer this object's affair.
    void leave() noexcept { m_taken = false; }

  private:
    const std::string& m_adapterName;
    bool m_taken = true;
};

/// Gives a claim back where the configuration wants it (ReleaseClaimAfterCheck). Nothing happens unless the
/// adapter is the one claimed. Never throws.
void releaseClaimIfConfigured(const std::string& adapterName) noexcept;
