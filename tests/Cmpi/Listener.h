// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Cmpi/LoadedFront.h"

namespace test {

/// A manager with subscriptions, who calls the indication interface for them.
class Listener {
  public:
    explicit Listener(LoadedFront& front) : m_front(front) { create(); }
    Listener(const Listener&) = delete;
    ~Listener() { m_front.clean(m_mi, true); }

    /// For every class again, as one of the managers does it.
    void create() {
        Call call(m_front.broker);
        m_front.create(call, "Quenx_Create_IndicationMI", m_mi);
    }

    cmpi::ReturnCode activate(const char* className = kClass, const std::string& nameSpace = kNamespace) {
        return filter(&Table::activateFilter, className, nameSpace, cmpi::Boolean{0});
    }
    /// @param isLast  as the manager says it
    cmpi::ReturnCode deactivate(const char* className = kClass, const std::string& nameSpace = kNamespace,
                                bool isLast = false) {
        return filter(&Table::deActivateFilter, className, nameSpace, cmpi::Boolean{isLast});
    }
    cmpi::ReturnCode authorize() { return filter(&Table::authorizeFilter, kClass, kNamespace, nullptr); }
    cmpi::ReturnCode mustPoll() { return filter(&Table::mustPoll, kClass, kNamespace); }
    cmpi::ReturnCode enable() { return plain(&Table::enableIndications); }
    cmpi::ReturnCode disable() { return plain(&Table::disableIndications); }

    /// In the managers' order.
    cmpi::ReturnCode begin() {
        const cmpi::ReturnCode code = activate();
        return code == cmpi::ReturnCode::Ok ? enable() : code;
    }
    void end() {
        deactivate();
        disable();
    }
    /// The codes of all interfaces, of this one last.
    std::string cleanup(bool isTerminating = false) {
        return m_front.cleanup(isTerminating) + m_front.clean(m_mi, isTerminating);
    }

  private:
    using Table = cmpi::IndicationMITable;
    static constexpr const char* kClass = "CIM_InstModification";
    static constexpr const char* kNamespace = "root/cimv2";

    template <class Function, class... Rest>
    cmpi::ReturnCode filter(Function function, const char* className, const std::string& nameSpace,
                            Rest... rest) {
        Call call(m_front.broker, {"", core::CimPath(className, {})}, nameSpace);
        return (m_mi->ft->*function)(m_mi, call.context.as<cmpi::Context>(), nullptr, className,
                                     call.path.as<cmpi::ObjectPath>(), rest...)
            .rc;
    }
    template <class Function>
    cmpi::ReturnCode plain(Function function) {
        Call call(m_front.broker);
        return (m_mi->ft->*function)(m_mi, call.context.as<cmpi::Context>()).rc;
    }

    LoadedFront& m_front;
    cmpi::IndicationMI* m_mi = nullptr;
};

}  // namespace test
