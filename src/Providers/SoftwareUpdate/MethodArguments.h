#pragma once

#include <initializer_list>
#include <string>
#include <vector>

#include "Framework/Model/CimValue.h"
#include "Framework/Model/CimPropertyList.h"

/// How the methods read their arguments. Every operation throws utils::EUnspecifiedError for an argument that
/// is not there, or is of another type than declared: "Expected %s argument".
namespace MethodArguments {

void requirePresent(const core::CimPropertyList& arguments, std::initializer_list<const char*> names);
/// Throws utils::EUnspecifiedError for the first that is null.
void requireNotNull(const core::CimPropertyList& arguments, std::initializer_list<const char*> names);

bool isNull(const core::CimPropertyList& arguments, const char* name);
std::string text(const core::CimPropertyList& arguments, const char* name);
/// Empty for a null argument, as is texts().
std::vector<unsigned short> codes(const core::CimPropertyList& arguments, const char* name);
std::vector<std::string> texts(const core::CimPropertyList& arguments, const char* name);
core::CimPath path(const core::CimPropertyList& arguments, const char* name);
void setCodes(const core::CimPropertyList& arguments, const char* name, std::vector<unsigned short> codes);

}  // namespace MethodArguments
