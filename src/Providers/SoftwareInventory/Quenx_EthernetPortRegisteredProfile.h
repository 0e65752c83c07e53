// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Providers/ClassObjects.h"
#include "Providers/Schema/CIM_RegisteredProfile.h"

/// Says that the ports are modelled as DMTF DSP1014 has it. Served as "Quenx_RegisteredProfile", a class that
/// other providers serve too.
class Quenx_EthernetPortRegisteredProfile : public CIM_RegisteredProfile {
  public:
    static constexpr core::CimClassInfo classInfo{"Quenx_RegisteredProfile",
                                                  &CIM_RegisteredProfile::classInfo};

    std::string getClassName() const override { return classInfo.name; }

    virtual void refresh();
};

class Quenx_EthernetPortRegisteredProfileClass : public SingletonClass<Quenx_EthernetPortRegisteredProfile> {
  public:
    Quenx_EthernetPortRegisteredProfileClass();
};
