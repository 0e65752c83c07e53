#pragma once

#include <string>

#include "Framework/Classes/InstanceList.h"

namespace core {

/// A class object: serves the instances of one class. Called from several threads at once.
class QUENX_EXPORT CimClass {
  public:
    CimClass();
    CimClass(const CimClass&) = delete;
    CimClass& operator=(const CimClass&) = delete;

    virtual std::string getClassName() = 0;
    /// The class's instances; the base version yields none.
    virtual utils::SafeList<CimInstance*>::Iterator getInstances();
    virtual void createInstance(CimInstance* instance);
    virtual void enableIndications();
    virtual void disableIndications();
    virtual ~CimClass();
};

}  // namespace core
