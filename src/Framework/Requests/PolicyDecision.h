// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string_view>

#include "Framework/Requests/Caller.h"
#include "Utils/Export.h"
#include "Utils/Policy.h"

namespace core {

/// The beginning of a refusal by a policy that cannot be obeyed.
inline constexpr std::string_view kBadPolicy = "nothing can be installed or deleted";

/// Leave to do what the policy guards: to call a method, to delete an instance. Asked for on the stack before
/// anything is claimed or changed. All that a call decides, it decides by the snapshot of its first decision:
/// one inside another on a thread asks nothing more.
///
/// A process with a front's session obeys the file that the session has; in any other one, a policy on the
/// machine refuses all, since nobody there says who calls.
class QUENX_EXPORT PolicyDecision {
  public:
    /// What is decided: to change something, which needs a caller who may, or to look whether it would go
    /// well, which anybody may.
    enum class Aim { Change, Look };

    /// @throws CimError (access denied) for a caller who may not, and where the policy cannot be obeyed; the
    /// text says why, and what would be right
    explicit PolicyDecision(Aim aim = Aim::Change);
    PolicyDecision(const PolicyDecision&) = delete;
    PolicyDecision& operator=(const PolicyDecision&) = delete;
    ~PolicyDecision();

    /// The snapshot by which the calling thread's call is decided. Where there is none, one that restricts
    /// nothing. Good until the outermost decision ends.
    static const utils::Policy& policy();

  private:
    const bool m_isOutermost;
    const Aim m_aim;
    std::shared_ptr<const utils::Policy> m_policy;  ///< null without a session
};

}  // namespace core
