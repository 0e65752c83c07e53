#pragma once

#include <pugixml.hpp>
#include <string>

#include "Framework/Model/CimValue.h"

namespace cimxml {

/// How the keys of paths are read.
enum class KeyTyping {
    Text,         ///< as texts: a server knows the declared types and goes by them alone
    ByAttributes  ///< by TYPE or else VALUETYPE: a client has nothing better
};

/// An object as a message names it. A class has no keys; an instance may lack them too, which only isClass
/// tells apart.
struct ObjectName {
    core::CimPath path;
    bool isClass = false;
};

/// LOCALNAMESPACEPATH: the names joined by slashes.
std::string readNamespace(const pugi::xml_node& element);

/// Any of INSTANCENAME, LOCALINSTANCEPATH, INSTANCEPATH, CLASSNAME, LOCALCLASSPATH, CLASSPATH. A single
/// unnamed key gets the empty name. WireError (not valid) for anything else, here and below.
ObjectName readObject(const pugi::xml_node& element, KeyTyping typing);

/// Whether readObject() takes elements of that name.
bool isObject(const pugi::xml_node& element);

/// VALUE.REFERENCE.
core::CimPath readReference(const pugi::xml_node& element, KeyTyping typing);

}  // namespace cimxml
