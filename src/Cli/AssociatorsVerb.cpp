// SPDX-License-Identifier: Apache-2.0
#include "Cli/Failure.h"
#include "Cli/InstanceList.h"
#include "Cli/Verbs.h"

namespace cli {

ExitStatus showAssociators(Context& context, const AssociatorsOrder& order) {
    const core::CimPath path(order.path);
    if (!path.isInstancePath()) {
        throw Failure(ExitStatus::WrongUse, "\"" + order.path + "\" is not the path of an instance.",
                      "Give one as \"quenxctl instances CLASS --names\" prints it, in single quotes.");
    }
    if (order.namesOnly) {
        printPaths(context, context.management.associatorNames(path, order.filter));
    } else {
        printInstances(context, context.management.associators(path, order.filter));
    }
    return ExitStatus::Done;
}

}  // namespace cli
