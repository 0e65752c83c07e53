#pragma once

#include <string_view>
#include <vector>

#include "Utils/Export.h"

namespace core {

/// A value of a property, method or parameter and its meaning; the value may be a range ("32768..65535").
struct ValueMeaning {
    std::string_view value;
    std::string_view meaning;
};

/// What the DMTF's published schema says of a class, property, method or parameter beside its type: the
/// qualifiers Description, ValueMap and Values. The texts live as long as the program.
struct SchemaQualifiers {
    std::string_view description;      ///< empty when not known here
    std::vector<ValueMeaning> values;  ///< empty when there are none, or none known here
};

QUENX_EXPORT SchemaQualifiers classQualifiers(std::string_view className);

/// @param className  the class that declares the element
/// @param element    a property or method, or "Method.Parameter"
QUENX_EXPORT SchemaQualifiers elementQualifiers(std::string_view className, std::string_view element);

}  // namespace core
