// SPDX-License-Identifier: Apache-2.0
#include "Cli/InstanceList.h"
#include "Cli/Verbs.h"

namespace cli {

ExitStatus showInstances(Context& context, const InstancesOrder& order) {
    if (order.namesOnly) {
        printPaths(context, context.management.enumerateInstanceNames(order.className));
    } else {
        printInstances(context, context.management.enumerateInstances(order.className));
    }
    return ExitStatus::Done;
}

}  // namespace cli
