#pragma once

#include <memory>
#include <span>

#include "Framework/Model/CimType.h"

namespace core {

class CimInstance;

/// Which way an argument of a method goes.
enum class CimDirection { In, Out };

/// One parameter of a method, as declared.
struct CimParameterInfo {
    const char* name;
    CimType type;
    bool isArray;
    CimDirection direction;
    /// A client may leave it out; it is then passed as null. Output parameters always are.
    bool optional;
    /// The class of a reference parameter, else null.
    const char* referenceClass;
};

/// One extrinsic method, as declared.
struct CimMethodInfo {
    const char* name;
    CimType returnType;
    std::span<const CimParameterInfo> parameters;
};

/// What a class says of itself, constant-initialised, so that static initialisation has no order to get
/// wrong. Properties are not listed here: they are read off an instance that makeSample builds, so the
/// members of the binding class are their only source.
struct CimClassInfo {
    const char* name;
    const CimClassInfo* superclass;
    bool isAssociation;
    std::span<const CimMethodInfo> methods;
    /// Builds a bare instance; null for a class that adds no properties to its superclass.
    std::unique_ptr<CimInstance> (*makeSample)();
};

/// For CimClassInfo::makeSample.
template <class T>
std::unique_ptr<CimInstance> makeSample() {
    return std::make_unique<T>();
}

}  // namespace core
