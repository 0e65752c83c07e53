// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <vector>

#include "Framework/Model/ClassDeclaration.h"

/// Declarations as MOF (DSP0004 annex A), each with a line end. All are thread-safe.
namespace cli {

/// The declarations of all qualifiers that classes here may carry.
std::string qualifiersMof();

std::string classMof(const core::ClassDeclaration& declaration);

/// The classes in an order that a compiler takes, the same on every machine: each behind its superclass and
/// behind the classes that it refers to, as far as those are among them and do not refer to each other.
/// @param classes  none of the chains empty
std::vector<core::ClassChain> inMofOrder(const std::vector<core::ClassChain>& classes);

}  // namespace cli
