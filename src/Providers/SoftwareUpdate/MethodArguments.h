// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <initializer_list>
#include <optional>
#include <string>
#include <vector>

#include "Framework/Model/CimPropertyList.h"
#include "Framework/Model/CimValue.h"
#include "Providers/SoftwareUpdate/ImageVerification.h"
#include "Providers/SoftwareUpdate/MethodResults.h"

/// Throws utils::EUnspecifiedError: the call is not as the method declares it.
[[noreturn]] void refuseArguments(const std::string& text);

/// The arguments of a method call. Every operation throws utils::EUnspecifiedError for an argument that was
/// not passed, or is of another type than declared: "Expected %s argument".
class MethodArguments {
  public:
    /// The list must outlive this object.
    explicit MethodArguments(const core::CimPropertyList& arguments) : m_arguments(arguments) {}

    void requirePresent(std::initializer_list<const char*> names) const;
    /// Throws utils::EUnspecifiedError for the first that is null.
    void requireNotNull(std::initializer_list<const char*> names) const;

    bool isNull(const char* name) const;
    std::string text(const char* name) const;
    /// Empty for a null argument, as is texts().
    std::vector<std::uint16_t> codes(const char* name) const;
    std::vector<std::string> texts(const char* name) const;
    core::CimPath path(const char* name) const;
    void setCodes(const char* name, std::vector<std::uint16_t> codes) const;

  private:
    const core::CimPropertyList& m_arguments;
};

/// Completes the order from the Target: a port stands for itself, a controller for its first port. With a
/// Source, a software identity, the image is that of the resource that has its file. What cannot be looked up
/// is not found, and what an instance of another provider throws is answered, not passed on.
/// @param source  null for a method without one
/// @return what the method returns at once, with a line in the log; nothing when the order is complete
std::optional<unsigned int> resolve(const MethodKind& kind, const core::CimPath* source,
                                    const core::CimPath& target, UpdateOrder& order);
