// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <memory>

#include "Cmpi/Cmpi.h"
#include "Framework/Requests/ProviderSession.h"
#include "Utils/Os/Linux/Mutex.h"

namespace cmpi {

/// The interfaces that the module offers, as bits of a set.
enum class Interface : unsigned int { Instance = 1, Association = 2, Method = 4, Indication = 8 };

/// One more hold on this library, to be given back by dlclose(); null where there is none to be had.
/// @param flags  more of those of dlopen()
void* openThisLibrary(int flags = 0) noexcept;

/// The one front of the process: which interfaces are in use, and the session that answers them. The session
/// is opened by the first request, and ended when the object manager has cleaned up all interfaces. Nothing
/// here waits for an update. Thread-safe; never destroyed, since requests may come while the process exits.
class Front {
  public:
    static Front& theOne();

    /// An interface is in use from now on. Object managers create each again for every class.
    void create(Interface interface, const Broker* broker);

    /// An interface is not needed any more. The answer is the same for all of them, until the last has been
    /// asked or there is another request or creation: DoNotUnload while there is something that only this
    /// process knows, see isBusy(). A request after Ok is served like the first one.
    ReturnCode cleanup(Interface interface);

    /// The end of the process: ends the session, which waits for updates that have begun, so that none is
    /// torn off. Later requests are refused.
    void leave();

    /// What the object manager offers; valid during a request.
    const Broker& broker() const { return *m_broker.load(std::memory_order_acquire); }

    /// One request. While it lives the session stays open.
    class Use {
      public:
        /// Throws CimError when there is no session to be had, with the reason.
        explicit Use(Interface interface) : m_operations(theOne().enter(interface)) {}
        ~Use() { theOne().exit(); }
        Use(const Use&) = delete;
        Use& operator=(const Use&) = delete;
        core::CimOperations& operations() const { return m_operations; }

      private:
        core::CimOperations& m_operations;
    };

  private:
    core::CimOperations& enter(Interface interface);
    void exit();
    /// A request is in hand, a job is listed, an adapter is claimed, or somebody listens. Jobs and their ids
    /// are lost with the process, and a claim keeps other updates away.
    bool isBusy() noexcept QUENX_REQUIRES(m_mutex);
    void use(Interface interface) QUENX_REQUIRES(m_mutex);

    struct Unload {
        void operator()(void* handle) const;
    };

    utils::Mutex m_mutex;
    std::atomic<const Broker*> m_broker{nullptr};
    std::unique_ptr<core::ProviderSession> m_session QUENX_GUARDED_BY(m_mutex);
    /// Holds the library itself while there is a session: an object manager may close it without having
    /// asked, or in spite of the answer. The session could not end then, since the loader unloads no library
    /// within the unloading of another one.
    std::unique_ptr<void, Unload> m_self QUENX_GUARDED_BY(m_mutex);
    unsigned int m_interfaces QUENX_GUARDED_BY(m_mutex) = 0;  ///< in use
    unsigned int m_requests QUENX_GUARDED_BY(m_mutex) = 0;    ///< in hand
    bool m_isLeaving QUENX_GUARDED_BY(m_mutex) = false;       ///< decided by a cleanup
    bool m_hasLeft QUENX_GUARDED_BY(m_mutex) = false;
};

}  // namespace cmpi
