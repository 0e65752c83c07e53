// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Framework/Model/ClassDeclaration.h"

namespace cli {

/// The classes as MOF (DSP0004 annex A) in an order that a compiler takes: the declarations of the qualifiers
/// first, then each class after its superclass and after the classes that it refers to, as far as those do
/// not refer to each other.
std::string mofText(const std::vector<core::ClassDeclaration>& classes);

}  // namespace cli
