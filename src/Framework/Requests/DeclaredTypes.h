// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <functional>

#include "Framework/Model/ClassDeclaration.h"
#include "Framework/Requests/RequestValues.h"

namespace core {

/// Finds a class with its superclasses; empty for an unknown class.
using ClassLookup = std::function<ClassChain(const std::string&)>;

/// Gives the keys of an instance's path, which a client may send as texts, the types and the spelling that
/// the class declares. A single key without a name gets that of the class's one key.
/// CimError: invalid parameter for a path that names nothing, invalid class for an unknown class, invalid
/// parameter when the keys are not exactly those of the class or a text does not read as its key's type.
QUENX_EXPORT CimPath typedPath(const CimPath& path, const ClassLookup& classes);

/// The arguments with their declared names and types; references in them as typedPath() makes them, where
/// they fit. CimError (invalid parameter) for one that the method does not declare or that comes twice, and
/// for a value of another kind than declared. Integers may come in any width that holds the value.
std::vector<Argument> typedArguments(const MethodDeclaration& method, const std::vector<Argument>& arguments,
                                     const ClassLookup& classes);

/// The argument of that name, without regard to case; null when it is not there.
const Argument* findArgument(const std::vector<Argument>& arguments, std::string_view name);

}  // namespace core
