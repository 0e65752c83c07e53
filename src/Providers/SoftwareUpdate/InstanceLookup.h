#pragma once

#include <string>
#include <vector>

#include "Framework/Model/CimValue.h"
#include "Providers/SoftwareUpdate/MethodResults.h"

namespace core {
class CimInstance;
}

/// The instance that the path names; null when there is none, also when the look-up throws.
core::CimInstance* findInstance(core::CimPath path) noexcept;

/// What a method's Target stands for.
struct ResolvedTarget {
    unsigned int returnValue;  ///< 0, or what the method returns at once
    std::string adapterName;
};

/// A port stands for itself, a controller for its first port. Failures are logged.
ResolvedTarget resolveTarget(const MethodTraits& method, const core::CimPath& target);

/// What a method's Source stands for.
struct ResolvedSource {
    unsigned int returnValue;  ///< 0, or what the method returns at once
    std::string uri;
    std::string targetTypes;  ///< joined by plus signs
};

/// The image of a software identity, found through the resource that has its file. Failures are logged.
ResolvedSource resolveSource(const MethodTraits& method, const core::CimPath& source);
