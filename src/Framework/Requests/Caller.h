// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "Utils/Export.h"

namespace core {

/// Who asks, as a front knows it. Any of the texts may come from a client.
struct Caller {
    std::string principal = {};    ///< the user's name; empty where nobody said one
    std::string address = {};      ///< the client's; "local" for a program of this machine
    std::string front = {};        ///< what the caller came through, "quenx-cimd"
    bool isAdministrator = false;  ///< whom the front lets do everything
    bool isFront = false;          ///< the front itself, which does what its own settings say
};

/// Says who asks on the calling thread for the length of a scope. Without one the caller has no name.
class QUENX_EXPORT CallerScope {
  public:
    explicit CallerScope(Caller caller);
    CallerScope(const CallerScope&) = delete;
    CallerScope& operator=(const CallerScope&) = delete;
    ~CallerScope();

    /// The calling thread's.
    static const Caller& current();

  private:
    const Caller m_caller;
    const CallerScope* const m_outer;
};

}  // namespace core
