#pragma once

#include "Framework/Classes/CimClass.h"
#include "Utils/Singleton.h"

/// How the installation methods reach the job registry. The registry owns its factory; constructing it makes
/// it the current one.
class ConcreteJobFactory : public utils::Singleton<ConcreteJobFactory> {
  public:
    explicit ConcreteJobFactory(core::CimClass* cimClass) : m_cimClass(cimClass) {}

    /// The registry; not owned.
    core::CimClass* getCimClass() const { return m_cimClass; }

    static const char* GetSingletonName() { return "ConcreteJobFactory"; }

  private:
    core::CimClass* m_cimClass;
};
