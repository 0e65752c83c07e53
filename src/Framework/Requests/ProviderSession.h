// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "Framework/Events/EventSink.h"
#include "Framework/Requests/CimOperations.h"
#include "Framework/Requests/ImageVerifier.h"
#include "Framework/Requests/UpdateSink.h"
#include "Utils/Os/Linux/LinuxOSLocker.h"
#include "Utils/Os/Linux/PolicyFile.h"
#include "Utils/Os/Linux/SMASHv2Config.h"

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

/// An operation of a library that fronts load by its name because they cannot link it. It stays loaded: its
/// threads and what it was asked for may outlive whoever loaded it.
class LibraryEntry {
  public:
    /// @param library  below the directory of the framework's own
    /// @param name     that the library exports it by
    LibraryEntry(const std::string& library, const char* name);

    /// Null where it cannot be had.
    void* address() const { return m_address; }
    /// Why not: the file, and the loader's words.
    const std::string& problem() const { return m_problem; }

  private:
    void* m_address = nullptr;
    std::string m_problem;
};

/// What every front holds while it serves: the providers' configuration, the policy that they obey, the
/// locker under which they write to adapters, and their libraries. Leaving waits for the updates that have
/// begun. One at a time in a process; used from one thread, but for the operations.
///
/// Which adapters there are is not its affair: a front that wants simulated ones says so to the adapter API
/// before it loads the providers.
class QUENX_EXPORT ProviderSession {
  public:
    /// @param configurationFile  empty for the system's
    /// @param policyFile         empty for the system's; see utils::PolicyFile. A bad one is logged, and
    ///                           refuses what a policy guards
    explicit ProviderSession(const std::string& configurationFile, const std::string& policyFile = {});
    ProviderSession(const ProviderSession&) = delete;
    ProviderSession& operator=(const ProviderSession&) = delete;

    /// Has the providers work on adapters under this locker, in place of a plain one. To be called before
    /// they are loaded, once.
    void workUnder(std::unique_ptr<os::OSLocker> locker) { m_chosenLocker = std::move(locker); }

    /// Has the providers tell this sink of updates. To be called before they are loaded, once; without it
    /// they tell nobody.
    void keepHistory(std::shared_ptr<UpdateSink> sink) { m_history.emplace(std::move(sink)); }

    /// The same with the sink of the library for this, history/libQuenx_History.so in the default directory,
    /// for fronts that cannot link it. Returns why it cannot be loaded; empty when it was.
    std::string loadHistory();

    /// Has the providers tell this sink of what happens to their instances, while somebody listens (see
    /// EventInterest). To be called before they are loaded, once; without it they tell nobody.
    void tellEvents(std::shared_ptr<EventSink> sink) { m_events.emplace(std::move(sink)); }

    /// Keeps an agent beside those of the libraries. To be called once at most.
    /// @param agent  ends it when given up
    void serve(std::shared_ptr<void> agent) { m_agent = std::move(agent); }

    /// Loads the providers of a directory, see ProviderLibraries::load().
    ProviderLibraries& libraries() { return m_libraries; }

    /// What is obeyed. Any thread may ask.
    utils::PolicyFile& policy() { return m_policy; }

    /// What the loaded providers answer, in the namespace that the configuration names. Shared with whatever
    /// stands in front of them.
    const std::shared_ptr<CimOperations>& operations() const { return m_operations; }

  private:
    // Destroyed last to first: the providers leave before what they use.
    std::optional<utils::SMASHv2Config> m_configuration;
    utils::PolicyFile m_policy;
    os::OSLockerLinux m_locker;
    std::unique_ptr<os::OSLocker> m_chosenLocker;  ///< hides the other one; see utils::Singleton
    LoadedVerifier m_verifier;
    const InstalledVerifier m_installedVerifier{m_verifier};
    std::optional<InstalledSink> m_history;
    std::optional<InstalledEventSink> m_events;
    ProviderLibraries m_libraries;
    std::shared_ptr<void> m_agent;
    std::shared_ptr<CimOperations> m_operations;
};

}  // namespace core
