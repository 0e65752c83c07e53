#pragma once

#include "Utils/Os/Linux/Thread.h"

namespace core {

class InstanceList;
class CimInstance;

/// The way from an instance back to the list that serves it; outlives both.
class InstanceListLink {
  public:
    explicit InstanceListLink(InstanceList* list) : m_list(list) {}

    /// Takes the instance out of its list, if the list still exists.
    void remove(const CimInstance* instance);
    /// The list is about to go.
    void close();

  private:
    utils::Mutex m_mutex;
    InstanceList* m_list QUENX_GUARDED_BY(m_mutex);
};

}  // namespace core
