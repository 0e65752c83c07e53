// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace core {
class CimProperty;
}

namespace cimxml {

/// What stands around the values of instances of one shape (see core::CimInstance::Shape): most of an answer.
/// Made at the first instance of a shape, and kept: a shape lives as long as the process and never changes.
class ShapeMarkup {
  public:
    /// @param shape       tells shapes apart
    /// @param properties  all of an instance of it
    /// Lives as long as the process. Thread-safe.
    static const ShapeMarkup& of(const void* shape, const std::vector<core::CimProperty*>& properties);

    explicit ShapeMarkup(const std::vector<core::CimProperty*>& properties);

    /// The element of the property by its index, up to its value, and without the start of VALUE or
    /// VALUE.ARRAY, as for a null one.
    std::string_view head(std::size_t index) const { return part(m_parts[index].head); }
    std::string_view nullHead(std::size_t index) const { return part(m_parts[index].nullHead); }
    /// For a key: KEYBINDING and KEYVALUE, up to the value, which is not null.
    std::string_view keyHead(std::size_t index) const { return part(m_parts[index].keyHead); }

  private:
    /// Of m_text.
    struct Range {
        std::uint32_t start = 0;
        std::uint32_t length = 0;
    };
    struct Parts {
        Range head;
        Range nullHead;
        Range keyHead;
    };

    std::string_view part(const Range& range) const {
        return std::string_view(m_text).substr(range.start, range.length);
    }

    std::string m_text;
    std::vector<Parts> m_parts;
};

}  // namespace cimxml
