#pragma once

#include <memory>
#include <utility>
#include <vector>

#include "Framework/Classes/InstanceList.h"
#include "Utils/Os/Linux/Mutex.h"

/// A class object's instances, one for each key, kept from call to call while the keys are the same. An
/// Instance is built from a Key and has refresh(). Thread-safe.
template <class Instance, class Key>
class KeptInstances {
  public:
    /// The instances for these keys, all of them fresh.
    core::InstanceList::Iterator getElements(const std::vector<Key>& keys) {
        if (!rebuild(keys)) refresh();
        return m_list.getElements(false);
    }

  private:
    /// False when the keys are those of the last time.
    bool rebuild(const std::vector<Key>& keys) {
        const utils::Mutex::AutoLocker lock(m_mutex);
        if (keys == m_keys) return false;
        core::InstanceList rebuilt;
        for (const Key& key : keys) {
            auto instance = std::make_unique<Instance>(key);
            instance->refresh();
            rebuilt.add(instance.release());
        }
        m_keys = keys;
        m_list.publish(rebuilt);
        return true;
    }

    void refresh() {
        for (core::CimInstance* instance : core::InstanceRange(m_list.getElements(false))) {
            static_cast<Instance*>(instance)->refresh();
        }
    }

    core::InstanceList m_list;
    utils::Mutex m_mutex;
    std::vector<Key> m_keys QUENX_GUARDED_BY(m_mutex);
};
