// SPDX-License-Identifier: Apache-2.0
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

/// What the schema says in words of a class or of one of its elements: the qualifiers Description, ValueMap
/// and Values.
struct CimElementText {
    /// A property or method that the class declares, "Method.Parameter", or "" for the class itself.
    const char* element;
    const char* description;
    /// "value=meaning;value=meaning", where a value may be a range ("32768..65535"). Empty without a
    /// ValueMap.
    const char* values = "";
};

/// What a class says of itself, constant-initialised, so that static initialisation has no order to get
/// wrong. Properties are not listed here: they are read off an instance that makeSample builds, so the
/// members of the binding class are their only source.
struct CimClassInfo {
    const char* name;
    const CimClassInfo* superclass;
    bool isAssociation = false;
    std::span<const CimMethodInfo> methods = {};
    /// Builds a bare instance; null for a class that adds no properties to its superclass.
    std::unique_ptr<CimInstance> (*makeSample)() = nullptr;
    std::span<const CimElementText> texts = {};
    /// Classes that a parameter names and nobody serves. Clients look up their declarations all the same.
    std::span<const CimClassInfo* const> mentioned = {};
};

/// For CimClassInfo::makeSample.
template <class T>
std::unique_ptr<CimInstance> makeSample() {
    return std::make_unique<T>();
}

}  // namespace core
