#pragma once

#include <string>
#include <vector>

#include "Framework/Model/ClassDeclaration.h"

namespace cli {

/// The classes as MOF (DSP0004 annex A), superclasses before their subclasses.
std::string mofText(std::vector<core::ClassDeclaration> classes);

}  // namespace cli
