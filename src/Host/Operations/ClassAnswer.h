// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <map>
#include <string>
#include <vector>

#include "Framework/Model/ClassDeclaration.h"
#include "Framework/Requests/RequestValues.h"

namespace host {

/// What of a class a client asks for (DSP0200 5.4.2.1).
struct ClassOptions {
    bool localOnly = true;
    bool includeQualifiers = true;
    bool includeClassOrigin = false;
    core::PropertyFilter properties;
};

/// The class as the answer shows it: each property and method once, by its nearest declaration, those of the
/// superclasses first, with the qualifiers that they and the class inherit.
core::ClassDeclaration classAnswer(const core::ClassChain& chain, const ClassOptions& options);

/// The names of all properties that the class has, for a filter that leaves out what its subclasses add.
std::vector<std::string> propertyNames(const core::ClassChain& chain);

/// The class that first declared each property, by folded property name.
std::map<std::string, std::string> originsOf(const core::ClassChain& chain);

}  // namespace host
