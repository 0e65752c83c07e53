// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>

#include "Framework/Requests/ProviderSession.h"
#include "History/History.h"

namespace history {

/// How many of the newest records are served.
inline constexpr std::int64_t kServedRecords = 1000;

/// Has the session serve the history as a record log, where its policy says so: Quenx_RecordLog,
/// Quenx_LogEntry for each of the newest records, Quenx_LogManagesRecord. Whoever is no administrator sees no
/// users and no addresses. Without that key, or without a history, nothing is added to what is served.
/// @param history  null where none is kept
void serveLog(core::ProviderSession& session, const std::shared_ptr<History>& history);

}  // namespace history
