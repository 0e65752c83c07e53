#pragma once

#include <utility>

#include "Framework/Classes/InstanceList.h"

namespace core {

/// Lets a for loop walk an enumeration: `for (CimInstance* each : InstanceRange(broker->getInstances(...)))`.
/// Holds the enumeration's elements while it lives; can be walked again when a walk has ended.
class InstanceRange {
  public:
    explicit InstanceRange(utils::SafeList<CimInstance*>::Iterator instances)
        : m_instances(std::move(instances)) {}

    struct End {};
    class Step {
      public:
        explicit Step(InstanceRange& range) : m_range(range), m_current(range.m_instances.first()) {}
        CimInstance* operator*() const { return m_current; }
        Step& operator++() {
            m_current = m_range.m_instances.next();
            return *this;
        }
        bool operator!=(End) const { return m_current != nullptr; }

      private:
        InstanceRange& m_range;
        CimInstance* m_current;
    };

    Step begin() { return Step(*this); }
    End end() const { return {}; }
    std::size_t size() { return m_instances.size(); }

  private:
    utils::SafeList<CimInstance*>::Iterator m_instances;
};

}  // namespace core
