// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>

#include "CimXml/Export.h"
#include "Framework/Events/EventSink.h"
#include "Indications/Query/Query.h"

namespace indications {

/// Which of a destination's indications one is (CIM_Indication, SequenceContext and SequenceNumber).
struct Sequence {
    std::string context;
    std::int64_t number = 0;
};

/// What is told of one event: CIM_InstCreation, CIM_InstModification or CIM_InstDeletion. Shared by all who
/// are told of it, and changed by none of them. Thread-safe.
class Indication {
  public:
    /// @param identifier  of this event alone
    /// @param host        of this server, for SourceInstanceHost
    /// @param classes     knows the classes of instances; used within the constructor
    Indication(const core::InstanceEvent& event, std::string identifier, std::string host,
               const core::ClassLookup& classes);

    const std::string& className() const { return m_className; }
    bool matches(const Query& query) const;

    /// What goes to one destination: what the query selects of it.
    cimxml::ExportedIndication exported(const Query& query, const std::string& filterName,
                                        const Sequence& sequence) const;

  private:
    std::string m_className;
    core::InstanceSnapshot m_source;
    core::InstanceSnapshot m_previous;  ///< of a modification only
    core::ClassChain m_sourceClass;
    std::vector<core::PropertyValue> m_properties;
};

}  // namespace indications
