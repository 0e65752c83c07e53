// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <pugixml.hpp>
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

/// Checks the bytes and builds the tree. Throws WireError (not well-formed).
void parseDocument(pugi::xml_document& document, std::string_view bytes);

}  // namespace cimxml
