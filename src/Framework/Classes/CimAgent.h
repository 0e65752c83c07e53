// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "Framework/Classes/CimClass.h"

namespace core {

/// A provider: a name and the class objects that it serves. The operations below answer by the class object
/// whose getClassName() equals the given name (without regard to case); an unknown name yields nothing.
class QUENX_EXPORT CimAgent {
  public:
    explicit CimAgent(std::string providerName);
    CimAgent(const CimAgent&) = delete;
    CimAgent& operator=(const CimAgent&) = delete;

    virtual bool isClassSupported(std::string className);
    virtual utils::SafeList<CimInstance*>::Iterator getInstances(std::string className);
    virtual void createInstance(CimInstance* instance);
    virtual void enableIndications(std::string className);
    virtual void disableIndications(std::string className);
    /// Calls leaveBroker() for agents whose own destructor did not.
    virtual ~CimAgent();

    const std::string& getProviderName() const { return m_providerName; }
    CimClasses& getClasses() { return m_classes; }

  protected:
    /// Takes the agent out of the broker, waits for the requests that use it, destroys its class objects and
    /// waits until every released instance is destroyed, so that its library can be unloaded. The most
    /// derived destructor calls it, before anything of the object is gone. Must not be called from within a
    /// request.
    void leaveBroker() noexcept;

    CimClasses m_classes;

  private:
    std::string m_providerName;
};

}  // namespace core
