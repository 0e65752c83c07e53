// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Cmpi/Slots.h"

/// What is begun with the object manager and has to be ended, each for a scope.
namespace cmpi {

/// What the object manager frees at the end of the call would grow with the number of results. Where it has
/// marks, what is made in the scope goes at once.
class Temporaries {
  public:
    explicit Temporaries(const Broker& broker) : m_broker(broker) {
        if (broker.mft != nullptr && broker.mft->release != nullptr)
            m_mark = call(broker, broker.mft, &BrokerMemTable::mark, nullptr);
    }
    ~Temporaries() {
        if (m_mark != nullptr) call(m_broker, m_broker.mft, &BrokerMemTable::release, m_mark);
    }
    Temporaries(const Temporaries&) = delete;
    Temporaries& operator=(const Temporaries&) = delete;

  private:
    const Broker& m_broker;
    void* m_mark = nullptr;
};

/// Makes a thread of our own one that may call the object manager. What it makes there goes at the end.
class Attachment {
  public:
    /// @param prepared  for this thread, and this one use; null attaches nothing
    Attachment(const Broker& broker, const Context* prepared) : m_broker(broker) {
        if (prepared == nullptr) return;
        const Status status = call(broker, broker.bft, &BrokerTable::attachThread, prepared);
        if (status.rc == ReturnCode::Ok) m_context = prepared;
    }
    /// The object manager frees the context with it.
    ~Attachment() {
        if (m_context != nullptr) call(m_broker, m_broker.bft, &BrokerTable::detachThread, m_context);
    }
    Attachment(const Attachment&) = delete;
    Attachment& operator=(const Attachment&) = delete;

    /// Null where the object manager did not attach the thread.
    const Context* context() const { return m_context; }

  private:
    const Broker& m_broker;
    const Context* m_context = nullptr;
};

/// A context for one use of a thread of our own, from that of a call, or from one that was prepared in one;
/// null where the object manager has none.
inline Context* preparedContext(const Broker& broker, const Context* from) {
    return call(broker, broker.bft, &BrokerTable::prepareAttachThread, from);
}

}  // namespace cmpi
