// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "Utils/Export.h"

namespace core {

/// The provider libraries of one directory, loaded as an object manager loads them: loading one runs its
/// static initialisers, which register its agent with the broker. They are unloaded, last to first, on
/// destruction, which waits for what their agents still have to end. Used from one thread.
class QUENX_EXPORT ProviderLibraries {
  public:
    /// A library that could not be loaded, and the loader's own words why.
    struct Problem {
        std::string file;
        std::string reason;
    };

    /// Where the libraries of this build are, providers among them: the directory of the framework's own.
    static std::string defaultDirectory();

    ProviderLibraries() = default;
    ~ProviderLibraries();
    ProviderLibraries(const ProviderLibraries&) = delete;
    ProviderLibraries& operator=(const ProviderLibraries&) = delete;

    /// Loads every libQuenx_*.so of the directory, in the order of their names. A support library among them
    /// is loaded too, which does nothing: it is there already. A library that does not load stops no other.
    /// Throws std::system_error when the directory cannot be read.
    void load(const std::string& directory);

    /// The files that are loaded.
    const std::vector<std::string>& loaded() const { return m_loaded; }
    const std::vector<Problem>& problems() const { return m_problems; }

  private:
    struct Close {
        void operator()(void* handle) const;
    };
    using Handle = std::unique_ptr<void, Close>;

    std::vector<Handle> m_handles;
    std::vector<std::string> m_loaded;
    std::vector<Problem> m_problems;
};

}  // namespace core
