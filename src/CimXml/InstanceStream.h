// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>

#include "CimXml/Response.h"
#include "CimXml/Xml.h"

namespace core {
class CimProperty;
}

namespace cimxml {

class ShapeMarkup;

/// The response message of an enumeration or of GetInstance, written while it goes on: no instance of it is
/// kept as a value. Byte for byte what writeResponse() makes of the same instances. Used on one thread.
class InstanceStream : public core::InstanceSink {
  public:
    /// Both as in the request, which has to outlive the stream.
    InstanceStream(const std::string& messageId, const std::string& operation)
        : m_messageId(messageId), m_operation(operation) {}

    /// Before the first instance: Instance, or NamedInstances, which they are if nobody says so.
    void setKind(ResultKind kind) { m_hasPaths = kind == ResultKind::NamedInstances; }

    std::size_t take(const core::InstanceCells& instance) override;
    std::size_t take(const core::InstanceValue& instance) override;

    /// The whole message; the stream is empty then.
    Pieces finish();

  private:
    const ShapeMarkup& markupOf(const core::CimInstance& instance);
    void writePath(const core::CimInstance& instance, const std::string& className,
                   const ShapeMarkup& markup);
    void writeProperty(const core::CimProperty& property, const ShapeMarkup& markup, std::size_t index);
    std::size_t size() const { return m_inFullPieces + m_text.size(); }
    std::size_t grown();
    void begin();
    void makeRoom();

    const std::string& m_messageId;
    const std::string& m_operation;
    bool m_hasPaths = true;
    Pieces m_full;
    std::size_t m_inFullPieces = 0;
    std::string m_text;  ///< the piece that is being written
    XmlWriter m_writer{m_text};
    std::size_t m_told = 0;  ///< of what the message takes
    // Of the last instance: most answers hold those of one shape.
    const void* m_shape = nullptr;
    const ShapeMarkup* m_markup = nullptr;
};

}  // namespace cimxml
