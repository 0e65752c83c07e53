// SPDX-License-Identifier: Apache-2.0
#include "Cli/InstanceList.h"

#include "Cli/Json.h"
#include "Cli/Terminal.h"
#include "Cli/Values.h"

namespace cli {

void printInstances(Context& context, const std::vector<core::InstanceValue>& instances) {
    if (context.json) {
        Json list = Json::array();
        for (const core::InstanceValue& instance : instances)
            list.push_back(toJson(instance));
        printJson(context.out, {{"instances", std::move(list)}});
        return;
    }
    for (const core::InstanceValue& instance : instances) {
        context.out << printable(instance.path.toString()) << '\n';
        for (const core::PropertyValue& property : instance.properties) {
            if (property.value.isNull()) continue;
            context.out << "    " << property.name << " = " << displayText(property.value) << '\n';
        }
    }
}

void printPaths(Context& context, const std::vector<core::CimPath>& paths) {
    if (context.json) {
        Json list = Json::array();
        for (const core::CimPath& path : paths)
            list.push_back(path.toString());
        printJson(context.out, {{"paths", std::move(list)}});
        return;
    }
    for (const core::CimPath& path : paths)
        context.out << printable(path.toString()) << '\n';
}

}  // namespace cli
