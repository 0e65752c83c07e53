#pragma once

#include <functional>
#include <string>

namespace test {

/// Runs the body in a forked child that has dropped to the user nobody, for what needs a refused permission
/// or a limit that root does not have. The body returns an empty text for success; what it returns, or how
/// the child died, is the result. GoogleTest's own macros do not reach out of the child.
std::string runAsNobody(const std::function<std::string()>& body);

}  // namespace test
