// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Framework/Model/CimValue.h"

namespace core {

class CimInstance;

/// A property of an instance, as a value.
struct PropertyValue {
    std::string name;
    CimValue value;
    bool isKey = false;
    std::string referenceClass;  ///< empty unless a reference
};

/// An instance, as a value: a copy taken under the instance's lock.
struct QUENX_EXPORT InstanceValue {
    CimPath path;
    std::vector<PropertyValue> properties;

    /// The property of that name, without regard to case; null when it is not there.
    const PropertyValue* find(std::string_view name) const;
};

/// Which properties an answer holds: all without a list, else those named (names that no class has are
/// ignored).
using PropertyFilter = std::optional<std::vector<std::string>>;

QUENX_EXPORT bool isWanted(const PropertyFilter& filter, std::string_view name);

/// A copy of the instance, under its lock; paths in it are completed with the namespace.
InstanceValue readInstance(CimInstance& instance, CimPath path, const PropertyFilter& filter,
                           const std::string& namespaceName);

/// What narrows a walk over associations (DSP0200 5.4.2.8 to 5.4.2.11). An empty text narrows nothing.
struct AssociationFilter {
    std::string associationClass;
    std::string resultClass;
    std::string role;
    std::string resultRole;
};

/// An argument of a method call, by name.
struct Argument {
    std::string name;
    CimValue value;
    /// The sender did not say of what type the texts in the value are: the declaration does.
    bool isUntyped = false;
};

struct MethodResult {
    std::uint32_t returnValue = 0;
    std::vector<Argument> outputs;  ///< those that are not null
    CimType returnType = CimType::Uint32;
};

}  // namespace core
