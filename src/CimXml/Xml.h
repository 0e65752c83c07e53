// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <string>
#include <string_view>

namespace cimxml {

/// What a document may hold at most, so that a small message cannot cost much memory or stack.
struct XmlLimits {
    std::size_t depth = 64;         ///< elements inside elements
    std::size_t elements = 100000;  ///< elements in all
    std::size_t attributes = 32;    ///< attributes of one element
};

/// Checks that the bytes are a well-formed XML 1.0 document in UTF-8, more strictly than the tree builder
/// does: every character allowed, balanced tags, one root, no repeated attribute, no document type, and no
/// entity but the five of XML and character references. Looks at each byte a fixed number of times and takes
/// no memory that grows with the document.
///
/// Throws WireError (not well-formed), also when a limit is passed.
void checkWellFormed(std::string_view document, const XmlLimits& limits = {});

/// Whether XML 1.0 allows the character (XML 1.0 2.2).
bool isXmlCharacter(char32_t character);

/// The bytes that the first character of the text takes, or 0 when the text is empty or does not begin with
/// UTF-8 (RFC 3629: shortest form, no surrogates) of a character that XML 1.0 allows.
std::size_t xmlCharacterLength(std::string_view text);

/// Whether the whole text is UTF-8 of characters that XML 1.0 allows.
bool isXmlText(std::string_view text);

/// Appends the text with `&`, `<`, `>` and `"` escaped, good for content and attributes alike. Characters
/// below U+0020 that XML forbids are dropped; any other bytes that are no allowed character become U+FFFD.
void appendEscaped(std::string& out, std::string_view text);

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
