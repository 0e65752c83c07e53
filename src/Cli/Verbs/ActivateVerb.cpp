// SPDX-License-Identifier: Apache-2.0
// Putting firmware in force that has been written.
#include "Cli/Display/Output.h"
#include "Cli/Display/Terminal.h"
#include "Cli/Update/Card.h"
#include "Cli/Verbs/Verbs.h"
#include "MidAPI/ma.h"

namespace cli {

namespace {

/// How an activation ended, for a person and for a script.
struct Ending {
    const char* result;
    Explanation why;
};

Ending endingOf(const ma::Activation& activation, const std::string& name) {
    const std::string because = activation.text.empty() ? "." : ": " + activation.text + ".";
    switch (activation.status) {
        case ma::Activation::Done:
            if (!activation.text.empty())
                return {"activated", {name + " was reset" + because, "", ExitStatus::Done}};
            return {"activated", {name + " runs the firmware in its flash.", "", ExitStatus::Done}};
        case ma::Activation::NotOffered:
            return {"not offered",
                    {name + " cannot be activated while the machine runs" + because,
                     "Restart the machine; some adapters need it to be without power for a moment."}};
        case ma::Activation::WouldDisrupt:
            return {"refused",
                    {"Activating " + name + " would cut the network" + because,
                     "Do it from another way in, or with --disrupt if you can do without for a moment."}};
        case ma::Activation::NotBack:
            return {"not back",
                    {name + " was reset, but is not all there again" + because,
                     "Look at \"ip link\" and the kernel's log; a restart of the machine brings it back.",
                     ExitStatus::Unknown}};
        case ma::Activation::StillPending:
            return {"still pending",
                    {name + " was reset, but its new firmware does not run yet" + because,
                     "Restart the machine; some adapters need it to be without power for a moment.",
                     ExitStatus::ResetPending}};
        case ma::Activation::Unknown:
            return {
                "unknown",
                {"Whether " + name + " was reset, and which firmware it runs, is not known" + because,
                 "\"quenxctl adapters\" and the kernel's log may tell; a restart of the machine brings it "
                 "back.",
                 ExitStatus::Unknown}};
        default:
            return {"failed",
                    {"The activation of " + name + " failed; the old firmware still runs" + because,
                     "The kernel's log may have more."}};
    }
}

ExitStatus print(Context& context, const Adapter& adapter, const ma::CardUse& card, const Ending& ending) {
    const Explanation& why = ending.why;
    if (context.json) {
        printJson(context.out, {{"result", ending.result},
                                {"exitStatus", static_cast<int>(why.status)},
                                {"message", why.message},
                                {"advice", why.advice},
                                {"adapter", adapter.name},
                                {"backend", adapter.backend},
                                {"card", cardJson(card)}});
        return why.status;
    }
    const bool isDone = why.status == ExitStatus::Done;
    if (!isDone && why.status != ExitStatus::AlreadyCurrent) {
        printFailure(context.error, why.message, why.advice);
        return why.status;
    }
    context.out << coloured(context.out, isDone ? Look::Success : Look::Plain, printable(why.message))
                << '\n';
    printHint(context.out, why.advice);
    return why.status;
}

}  // namespace

ExitStatus activate(Context& context, const VerbOptions& options) {
    const Adapter adapter = findAdapter(context.connection, options.update.target);
    const std::string& name = adapter.name;
    const std::string label = labelOf(name, adapter.backend);
    const ma::CardUse card = readCard(context.connection, name);
    if (!context.json) printCard(context.out, card);
    if (ma::getAdapterInfo(name).resetNeeded == ma::ResetNeeded::None) {
        return print(context, adapter, card,
                     {"already current",
                      {label + " runs the firmware in its flash: nothing waits for a reset.", "",
                       ExitStatus::AlreadyCurrent}});
    }
    const Ending ending = endingOf(activateFirmware(name, options.mayDisrupt), label);
    context.following.over();
    return print(context, adapter, card, ending);
}

}  // namespace cli
