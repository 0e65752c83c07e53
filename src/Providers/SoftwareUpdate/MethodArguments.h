// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <initializer_list>
#include <string>
#include <vector>

#include "Framework/Model/CimPropertyList.h"
#include "Framework/Model/CimValue.h"
#include "Providers/SoftwareUpdate/MethodResults.h"

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

/// What a method's Target stands for.
struct ResolvedTarget {
    unsigned int returnValue;  ///< 0, or what the method returns at once
    std::string adapterName;
};

/// A port stands for itself, a controller for its first port. What cannot be looked up is not found. Failures
/// are logged. Throws what an instance of the inventory throws.
ResolvedTarget resolveTarget(const MethodTraits& method, const core::CimPath& target);

/// What a method's Source stands for.
struct ResolvedSource {
    unsigned int returnValue;  ///< 0, or what the method returns at once
    std::string uri;
    std::string targetTypes;  ///< joined by plus signs
};

/// The image of a software identity, found through the resource that has its file; else as resolveTarget().
ResolvedSource resolveSource(const MethodTraits& method, const core::CimPath& source);
