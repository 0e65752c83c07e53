// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "CimXml/Response.h"

/// The messages by which indications go to listeners (DSP0200 5.4.3, DSP0201 5.2.3).
namespace cimxml {

/// A property that holds a whole instance.
struct EmbeddedInstance {
    std::string name;
    std::shared_ptr<const core::InstanceValue> instance;  ///< not null
};

/// An indication as it is sent.
struct ExportedIndication {
    std::string className;
    std::vector<core::PropertyValue> properties;
    std::vector<EmbeddedInstance> embedded;
};

/// The request message of ExportIndication, in the form that the common listeners read. Thread-safe, no
/// state.
std::string writeExport(const ExportedIndication& indication, std::string_view messageId);

/// What a listener answers: nothing when it has taken the indication, else its error. Throws WireError for
/// bytes that are no such answer. Thread-safe, no state.
std::optional<ErrorResult> readExportAnswer(std::string_view bytes);

/// An indication as a listener reads it.
struct ReceivedIndication {
    std::string messageId;
    core::InstanceValue indication;  ///< its class in the path; embedded instances as texts
    core::InstanceValue source;      ///< SourceInstance; without properties where there is none
};

/// Reads the message of writeExport(), or another server's. Throws WireError for bytes that are none.
/// Thread-safe, no state.
ReceivedIndication readExport(std::string_view bytes);

/// The answer of a listener that has taken it. Thread-safe, no state.
std::string writeExportAnswer(std::string_view messageId);

}  // namespace cimxml
