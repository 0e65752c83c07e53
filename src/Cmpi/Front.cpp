// SPDX-License-Identifier: Apache-2.0
#include "Cmpi/Front.h"

#include <dlfcn.h>

#include <new>

#include "Cmpi/Listening.h"
#include "Framework/Classes/CimBroker.h"
#include "Framework/Classes/InstanceList.h"
#include "Framework/Model/CimError.h"
#include "Logind/InhibitingLocker.h"
#include "Providers/Schema/ProviderInterfaces.h"
#include "Utils/Log.h"
#include "Utils/Os/Linux/linux.h"

namespace cmpi {

namespace {

using core::CimError;
using core::CimStatus;
using core::ProviderLibraries;
using Locker = utils::Mutex::AutoLocker;

/// A library that does not load is logged, and the others serve.
std::unique_ptr<core::ProviderSession> openSession() {
    // A daemon may have closed them. An image that got one of their numbers would count as not readable, and
    // whatever somebody prints would go into files.
    os::openStandardDescriptors();
    const std::string directory = ProviderLibraries::defaultDirectory();
    auto session = std::make_unique<core::ProviderSession>("");
    // Object managers give a call up after 40 seconds: 5 are more for the whole file, 15 for the adapter.
    utils::SMASHv2Config::getInstance()->setDefaultImageReadTimeout(std::chrono::seconds(20));
    logind::loadLibrary();
    session->workUnder(std::make_unique<logind::InhibitingLocker>("Quenx providers"));
    if (const std::string problem = session->loadHistory(); !problem.empty())
        utils::writeAuditLog("[history] No record is kept of updates: " + utils::escapeForLog(problem, 400));
    session->tellEvents(Listening::theOne().sink());
    session->libraries().load(directory);
    for (const ProviderLibraries::Problem& problem : session->libraries().problems())
        QUENX_ERROR("Cannot load %s: %s", problem.file.c_str(), problem.reason.c_str());
    if (core::GetCimBroker()->useAgents().empty())
        throw CimError(CimStatus::Failed,
                       "There is no provider library in " + directory +
                           ". Install the libraries that came with libQuenx_Cmpi.so there.");
    return session;
}

/// By the standard's class, so that instances of any provider count; none where no provider serves it.
bool hasInstances(core::CimOperations& operations, const char* className) {
    return !operations.getClass(className).empty() && !operations.enumerateInstanceNames(className).empty();
}

/// The end of the process; that of the library where no session is open.
struct End {
    ~End() { Front::theOne().leave(); }
};
const End end;

}  // namespace

void* openThisLibrary(int flags) noexcept {
    Dl_info own{};
    static const char inside = 0;
    ::dladdr(&inside, &own);
    return ::dlopen(own.dli_fname, RTLD_LAZY | RTLD_NOLOAD | flags);
}

Front& Front::theOne() {
    alignas(Front) static unsigned char place[sizeof(Front)];
    static Front* const front = new (place) Front;
    return *front;
}

void Front::Unload::operator()(void* handle) const {
    ::dlclose(handle);
}

void Front::use(Interface interface) {
    m_interfaces |= static_cast<unsigned int>(interface);
    m_isLeaving = false;
}

void Front::create(Interface interface, const Broker* broker) {
    m_broker.store(broker, std::memory_order_release);
    const Locker lock(m_mutex);
    use(interface);
}

bool Front::isBusy() noexcept try {
    if (m_requests != 0) return true;
    if (m_session == nullptr) return false;
    if (Listening::theOne().isBusy()) return true;
    core::CimOperations& operations = *m_session->operations();
    return hasInstances(operations, "CIM_ConcreteJob") || !update::claimedAdapter(operations).empty() ||
           core::isReaperBusy();
} catch (...) {
    // Whoever cannot look stays.
    return true;
}

ReturnCode Front::cleanup(Interface interface) {
    const Locker lock(m_mutex);
    if (!m_isLeaving && isBusy()) return ReturnCode::DoNotUnload;
    m_isLeaving = true;
    m_interfaces &= ~static_cast<unsigned int>(interface);
    if (m_interfaces == 0) {
        if (m_session != nullptr) Listening::theOne().endWithSession(false);
        m_session.reset();
        m_self.reset();
        m_isLeaving = false;
    }
    return ReturnCode::Ok;
}

void Front::leave() {
    std::unique_ptr<core::ProviderSession> session;
    {
        const Locker lock(m_mutex);
        m_hasLeft = true;
    }
    Listening::theOne().endWithSession(true);
    {
        const Locker lock(m_mutex);
        // A request that still runs at the exit of a process needs what it uses.
        if (m_requests == 0) session = std::move(m_session);
    }
    // Waits for updates, and no request has to wait with it.
}

core::CimOperations& Front::enter(Interface interface) try {
    const Locker lock(m_mutex);
    if (m_hasLeft) throw CimError(CimStatus::Failed, "the process is about to end");
    if (m_session == nullptr) {
        m_session = openSession();
        m_self.reset(openThisLibrary());
    }
    use(interface);
    ++m_requests;
    return *m_session->operations();
} catch (...) {
    core::rethrowAsCimError();
}

void Front::exit() {
    const Locker lock(m_mutex);
    --m_requests;
}

}  // namespace cmpi
