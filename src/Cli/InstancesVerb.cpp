// SPDX-License-Identifier: Apache-2.0
#include "Cli/Failure.h"
#include "Cli/InstanceList.h"
#include "Cli/Suggestion.h"
#include "Cli/Verbs.h"
#include "Framework/Model/CimError.h"

namespace cli {

namespace {

/// None where a server does not list them.
std::vector<std::string> servedClasses(Management& management) try {
    std::vector<std::string> names;
    for (const core::ClassDeclaration& declaration : management.classes())
        names.push_back(declaration.name);
    return names;
} catch (const core::CimError&) {
    return {};
}

}  // namespace

ExitStatus showInstances(Context& context, const InstancesOrder& order) try {
    if (order.namesOnly) {
        printPaths(context, context.management.enumerateInstanceNames(order.className));
    } else {
        printInstances(context, context.management.enumerateInstances(order.className));
    }
    return ExitStatus::Done;
} catch (const core::CimError& error) {
    if (error.status() != core::CimStatus::InvalidClass) throw;
    throw Failure(ExitStatus::NotFound, "No class \"" + order.className + "\" is served.",
                  didYouMean(order.className, servedClasses(context.management)) + ASK_MOF);
}

}  // namespace cli
