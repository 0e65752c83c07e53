// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_OwningJobElement.h"

/// The service owns a job.
class Quenx_OwningJobElement : public CIM_OwningJobElement {
  public:
    static const core::CimClassInfo classInfo;

    std::string getClassName() const override;
    ~Quenx_OwningJobElement() override;
};

/// Rebuilt on every enumeration. Throws the assertion unless there is one service.
class Quenx_OwningJobElementClass : public ListedClass<Quenx_OwningJobElement> {
  public:
    utils::SafeList<core::CimInstance*>::Iterator getInstances() override;
};
