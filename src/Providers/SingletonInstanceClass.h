#pragma once

#include <memory>
#include <string>

#include "Framework/Classes/CimClass.h"
#include "Utils/Debug.h"
#include "Utils/Log.h"

/// A class object with one instance, made and refreshed at the first enumeration and kept from then on.
template <class T>
class SingletonInstanceClass : public core::CimClass {
  public:
    using Instance = T;

    /// The label names the enumeration in the log; several classes may share one.
    explicit SingletonInstanceClass(const char* label) : m_label(label) {}

    std::string getClassName() override { return T::classInfo.name; }

    utils::SafeList<core::CimInstance*>::Iterator getInstances() override {
        QUENX_DEBUG("getInstance");
        const utils::TimeStamp timing(m_label);
        createOnce();
        QUENX_DEBUG("return %d", static_cast<int>(m_instances.size()));
        return m_instances.getElements(false);
    }

  private:
    /// Two first calls on two threads make one instance.
    void createOnce() {
        const utils::Mutex::AutoLocker lock(m_creation);
        if (m_instances.getElements(false).first() != nullptr) return;
        QUENX_DEBUG("create new instance");
        auto instance = std::make_unique<T>();
        instance->refresh();
        m_instances.add(instance.release());
    }

    core::InstanceList m_instances;
    utils::Mutex m_creation;
    const char* m_label;
};
