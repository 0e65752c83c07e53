// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <map>
#include <string>
#include <vector>

#include "CimXml/Response.h"
#include "CimXml/Xml.h"

namespace cimxml {

/// The response message of an enumeration, written while it goes on: no instance of it is kept as a value.
/// Byte for byte what writeResponse() makes of the same instances. Used on one thread.
class InstanceStream : public core::InstanceSink {
  public:
    /// Both as in the request, which has to outlive the stream.
    InstanceStream(const std::string& messageId, const std::string& operation)
        : m_messageId(messageId), m_operation(operation) {}

    std::size_t take(const core::InstanceCells& instance) override;
    std::size_t take(const core::InstanceValue& instance) override;

    /// The whole message; the stream is empty then.
    std::string finish();

  private:
    /// What is around the value of a property.
    struct Markup {
        std::string head;
        std::string tail;
        std::string null;  ///< the whole element without a value
    };
    /// Of the wanted properties of one shape.
    using ShapeMarkup = std::vector<Markup>;

    static ShapeMarkup markupOf(const core::InstanceCells& instance);
    void writeInstance(const core::InstanceCells& instance, const ShapeMarkup& markup);
    std::size_t grown();
    void begin();
    void makeRoom();

    const std::string& m_messageId;
    const std::string& m_operation;
    std::string m_text;
    XmlWriter m_writer{m_text};
    std::size_t m_told = 0;  ///< of what the text takes
    /// Made when a second instance of a shape comes: most of a long answer is markup.
    std::map<const void*, ShapeMarkup> m_shapes;
};

}  // namespace cimxml
