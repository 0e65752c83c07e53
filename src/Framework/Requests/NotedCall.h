// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "Framework/Requests/Reasons.h"

namespace core {

/// What was learnt of a call on its way.
struct CallNotes {
    ReasonId reason = ReasonId::None;  ///< why it was refused; the first reason counts
    std::string sha256 = {};           ///< of the image that was read
    std::string signedBy = {};         ///< the key by which it is trusted
};

/// Collects the notes of the calls that the calling thread carries out for the length of a scope, for whoever
/// tells of them afterwards: the audit trail, the history, the client. Those around it collect them, too.
class QUENX_EXPORT NotedCall {
  public:
    NotedCall();
    NotedCall(const NotedCall&) = delete;
    NotedCall& operator=(const NotedCall&) = delete;
    ~NotedCall();

    const CallNotes& notes() const { return m_notes; }

    /// Whether anybody collects on this thread. Without that, what is noted is lost.
    static bool isCollecting() noexcept;
    static void noteReason(ReasonId id) noexcept;
    /// Left out where there is no memory for it.
    static void noteImage(const std::string& sha256) noexcept;
    /// Likewise.
    static void noteKey(const std::string& key) noexcept;

  private:
    CallNotes m_notes;
    NotedCall* const m_outer;
};

}  // namespace core
