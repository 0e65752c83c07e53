// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <functional>
#include <string>

#include "Indications/Subscriptions/Records.h"

namespace indications {

/// The file in which subscriptions outlive the daemon: JSON, its version first, replaced as a whole with each
/// change. Used by one thread at a time.
class StateFile {
  public:
    /// @param path  empty: nothing is kept
    explicit StateFile(std::string path) : m_path(std::move(path)) {}

    /// What was written last; nothing where there is no file. A file that makes no sense is renamed, and one
    /// that cannot be read or renamed is not written over; both with a line in the log.
    Records read();
    /// Keeps a copy of the file as it is now, since the next write leaves something out.
    void keepCopy();
    /// Writes all but the server's own. CimError (failed) when it cannot be: the old file is as it was.
    void write(const Records& records);

    bool isKept() const { return !m_path.empty(); }

  private:
    const std::string m_path;
    std::string m_obstacle;  ///< why nothing may be written
};

}  // namespace indications
