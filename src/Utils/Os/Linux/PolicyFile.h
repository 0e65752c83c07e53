// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <memory>
#include <optional>
#include <string>

#include "Utils/Export.h"
#include "Utils/Os/Linux/Mutex.h"
#include "Utils/Policy.h"

namespace utils {

/// Where the policy of the machine lies: /etc/quenx/policy.toml. Only a test sets another.
QUENX_EXPORT extern std::atomic<const char*> systemPolicyFile;

/// The policy file that a process obeys. Its text is read for each decision, so an edit counts from the next
/// one on, whatever the clock says, and a decision keeps the snapshot that it began with. A file that is
/// missing allows what there is; one that is there must be right to the last key, and nobody but root and the
/// user of the process may be able to change it: a link, another owner, rights to write for others, to it or
/// to its folder, are as wrong as a misspelt key. Thread-safe.
class QUENX_EXPORT PolicyFile {
  public:
    /// @param path  empty for the machine's; a file that is named has to be there
    explicit PolicyFile(const std::string& path = {});
    PolicyFile(const PolicyFile&) = delete;
    PolicyFile& operator=(const PolicyFile&) = delete;
    ~PolicyFile();

    /// What holds now; never null. Logs what is wrong, once for each change.
    /// @throws PolicyError
    std::shared_ptr<const Policy> current();
    /// What current() would throw; empty when the policy can be obeyed.
    std::string problem();

    /// The newest one alive in this process; null when there is none.
    static PolicyFile* ofProcess() noexcept;
    /// Whether there is anything where the policy of the machine lies, or that cannot be told.
    static bool isOnMachine() noexcept;

  private:
    const std::string m_path;
    const bool m_isNamed;
    PolicyFile* const m_outer;
    Mutex m_mutex;
    std::optional<std::string> m_text QUENX_GUARDED_BY(m_mutex);
    std::shared_ptr<const Policy> m_policy QUENX_GUARDED_BY(m_mutex);  ///< in m_text
    std::string m_problem QUENX_GUARDED_BY(m_mutex);
};

}  // namespace utils
