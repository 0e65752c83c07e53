// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_OwningJobElement.h"

/// The service owns a job.
class Quenx_OwningJobElement : public CIM_OwningJobElement {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_OwningJobElement", &CIM_OwningJobElement::classInfo,
                                                  true};

    std::string getClassName() const override { return classInfo.name; }
};

/// Rebuilt on every enumeration. Throws the assertion unless there is one service.
class Quenx_OwningJobElementClass : public ListedClass<Quenx_OwningJobElement> {
  public:
    core::InstanceList::Iterator getInstances() override;
};
