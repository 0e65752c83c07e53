#pragma once

#include <string>
#include <string_view>

#include "CimXml/XmlText.h"

namespace cimxml {

/// Appends markup to one buffer. Names are the caller's literals and go out as they are; attribute values and
/// texts are escaped. Elements are closed by an end tag unless empty() is called, which only NAMESPACE,
/// CLASSNAME, ERROR and SCOPE may be: some clients fail on others that close themselves.
class XmlWriter {
  public:
    explicit XmlWriter(std::string& out) : m_out(out) {}

    /// "<NAME"; attributes, then content() or empty() must follow.
    XmlWriter& start(std::string_view name) { return raw("<").raw(name); }
    XmlWriter& attribute(std::string_view name, std::string_view value) {
        raw(" ").raw(name).raw("=\"");
        appendEscaped(m_out, value);
        return raw("\"");
    }
    XmlWriter& content() { return raw(">"); }
    XmlWriter& empty() { return raw("/>"); }

    /// An element without attributes.
    XmlWriter& open(std::string_view name) { return raw("<").raw(name).raw(">"); }
    XmlWriter& end(std::string_view name) { return raw("</").raw(name).raw(">"); }

    XmlWriter& text(std::string_view value) {
        appendEscaped(m_out, value);
        return *this;
    }
    /// What is markup already, or needs no escaping.
    XmlWriter& raw(std::string_view markup) {
        m_out.append(markup);
        return *this;
    }

  private:
    std::string& m_out;
};

}  // namespace cimxml
