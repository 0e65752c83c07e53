// SPDX-License-Identifier: Apache-2.0
#include "Cli/Json.h"
#include "Cli/Mof.h"
#include "Cli/Verbs.h"

namespace cli {

ExitStatus showMof(Context& context) {
    const std::string text = mofText(context.management.classes());
    if (context.json) {
        printJson(context.out, {{"mof", text}});
    } else {
        context.out << text;
    }
    return ExitStatus::Done;
}

}  // namespace cli
