#pragma once

#include <memory>
#include <vector>

#include "Framework/Model/CimInstance.h"
#include "Utils/Containers.h"

namespace core {

/// A class object's instances. Owns them: an element is destroyed when the list and every snapshot, iterator
/// and request that holds it have let go. Thread-safe.
class QUENX_EXPORT InstanceList : public utils::SafeList<CimInstance*> {
  public:
    using Snapshot = std::vector<std::shared_ptr<CimInstance>>;

    InstanceList();
    ~InstanceList() override;

    /// An iterator over the list as it is now; later changes do not show in it. The iterator, and the calling
    /// thread's request scope if there is one, keep the elements alive.
    Iterator getElements() override;
    /// The same; the flag has no meaning here and is kept for callers that pass it.
    Iterator getElements(bool all);

    /// Appends and takes ownership, also when it throws. The calling thread's request scope holds it too.
    void add(CimInstance* element);
    /// Lets go of every element.
    void clear();
    /// Lets go of one element; false when it is not listed.
    bool remove(const CimInstance* element);
    /// Takes over the other list's elements and lets go of its own, in one step: nobody sees half a list.
    /// The other list is left empty.
    void publish(InstanceList& rebuilt);

  private:
    using SharedSnapshot = std::shared_ptr<const Snapshot>;

    SharedSnapshot snapshot();

    std::shared_ptr<InstanceListLink> m_link;
    Snapshot m_held QUENX_GUARDED_BY(getMutex());
    SharedSnapshot m_cached QUENX_GUARDED_BY(getMutex());
};

}  // namespace core
