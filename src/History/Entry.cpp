// SPDX-License-Identifier: Apache-2.0
// What a front asks of the history's library that has loaded it by its name.
#include "Control/Sha256.h"
#include "History/Log/LogAgent.h"

extern "C" QUENX_EXPORT void quenx_openHistory(core::ProviderSession& session);

void quenx_openHistory(core::ProviderSession& session) {
    // Loads what computes sums. Later a request would load it, for which a manager may wait that unloads the
    // providers and has the loader's lock.
    const control::Sha256 loaded;
    const std::shared_ptr<history::History> history = history::History::wanted();
    session.keepHistory(history);
    // Whoever died in an update cannot tell any more how it ended.
    if (history) history->look();
    history::serveLog(session, history);
}
