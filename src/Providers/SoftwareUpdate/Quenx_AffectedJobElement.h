#pragma once

#include "Framework/Classes/CimClass.h"
#include "Providers/Schema/CIM_AffectedJobElement.h"

/// A job updates a port, and so the card that carries it.
class Quenx_AffectedJobElement : public CIM_AffectedJobElement {
  public:
    static const core::CimClassInfo classInfo;

    std::string getClassName() const override;
    ~Quenx_AffectedJobElement() override;
};

/// Rebuilt on every enumeration; the cost is jobs + ports + controllers.
class Quenx_AffectedJobElementClass : public core::CimClass {
  public:
    using Instance = Quenx_AffectedJobElement;

    std::string getClassName() override;
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;

  private:
    core::InstanceList m_instances;
};
