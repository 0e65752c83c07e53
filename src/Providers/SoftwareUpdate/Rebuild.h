#pragma once

#include "Framework/Classes/InstanceList.h"

/// Fills a list anew and publishes it in one step, so that two rebuilds at once neither double nor drop
/// anything. Where it is given up before that, by an exception, the list is left empty.
class Rebuild {
  public:
    /// The list must outlive the rebuild.
    explicit Rebuild(core::InstanceList& instances) : m_instances(instances) {}
    ~Rebuild() {
        if (!m_published) m_instances.clear();
    }
    Rebuild(const Rebuild&) = delete;
    Rebuild& operator=(const Rebuild&) = delete;

    /// Adds an instance, which the list owns from then on.
    void add(std::unique_ptr<core::CimInstance> instance) { m_rebuilt.add(instance.release()); }
    void publish() {
        m_instances.publish(m_rebuilt);
        m_published = true;
    }

  private:
    core::InstanceList& m_instances;
    core::InstanceList m_rebuilt;
    bool m_published = false;
};
