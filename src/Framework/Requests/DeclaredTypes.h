#pragma once

#include <functional>

#include "Framework/Model/CimPath.h"
#include "Framework/Model/ClassDeclaration.h"

namespace core {

/// Finds a class with its superclasses; empty for an unknown class.
using ClassLookup = std::function<ClassChain(const std::string&)>;

/// Gives the keys of an instance's path, which a client may send as texts, the types and the spelling that
/// the class declares. A single key without a name gets that of the class's one key.
/// CimError: invalid parameter for a path that names nothing, invalid class for an unknown class, invalid
/// parameter when the keys are not exactly those of the class or a text does not read as its key's type.
QUENX_EXPORT CimPath typedPath(const CimPath& path, const ClassLookup& classes);

/// The same for a path that an argument or a key holds: one that does not fit is left as it is, and equals
/// nothing.
CimPath typedReference(const CimPath& path, const ClassLookup& classes);

}  // namespace core
