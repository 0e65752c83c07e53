// SPDX-License-Identifier: Apache-2.0
// The verbs that print what the providers declare: the schema, and what other object managers ask for.
#include <algorithm>

#include "Cli/Display/Mof.h"
#include "Cli/Display/Output.h"
#include "Cli/Display/Terminal.h"
#include "Cli/Registration/Registration.h"
#include "Cli/Verbs/Verbs.h"

namespace cli {

namespace {

std::string wholeMof(const std::vector<core::ClassChain>& classes) {
    std::string text = qualifiersMof();
    for (const core::ClassChain& chain : inMofOrder(classes))
        text += "\n" + classMof(*chain.front());
    return text;
}

std::string pathOf(const std::string& directory, const RegistrationFile& file) {
    return directory + (directory.ends_with('/') ? "" : "/") + file.name;
}

/// Without a folder the files are shown one below the other, as "head" shows several.
void show(std::ostream& out, const std::vector<RegistrationFile>& files) {
    for (const RegistrationFile& file : files) {
        if (files.size() > 1) out << (&file == files.data() ? "" : "\n") << "==> " << file.name << " <==\n";
        out << file.text;
    }
}

/// @param changed  those of the files that were written
void tell(std::ostream& out, const Registration& registration, const std::optional<std::string>& directory,
          const std::vector<std::string>& changed) {
    if (!directory) {
        // On its own, the text on standard output would look like the whole work.
        out << "Nothing was written. --output DIR puts this into a folder.\n";
    } else {
        for (const RegistrationFile& file : registration.files) {
            const bool isChanged = std::ranges::find(changed, file.name) != changed.end();
            out << printable(pathOf(*directory, file))
                << (isChanged ? " was written.\n" : " is up to date.\n");
        }
    }
    out << "What to do next, as root" << (directory ? ", in that folder" : ", with that in a folder")
        << ":\n";
    for (const std::string& step : registration.nextSteps)
        out << "  " << step << '\n';
    out << "The page object-managers.md has the details, and what to check when it does not come up.\n";
}

Json documentOf(const Registration& registration, const std::optional<std::string>& directory,
                const std::vector<std::string>& changed) {
    Json files = Json::array();
    for (const RegistrationFile& file : registration.files) {
        Json entry{{"name", file.name}, {"text", file.text}};
        if (directory) {
            entry["path"] = pathOf(*directory, file);
            entry["written"] = std::ranges::find(changed, file.name) != changed.end();
        }
        files.push_back(std::move(entry));
    }
    return {{"files", std::move(files)}, {"next", registration.nextSteps}};
}

}  // namespace

ExitStatus showMof(Context& context, const VerbOptions&) {
    const std::string text = wholeMof(context.connection.operations->enumerateClasses("", true));
    if (context.json) {
        printJson(context.out, {{"mof", text}});
    } else {
        // A server's descriptions are texts like any other; only line ends are the program's own.
        auto lines = utils::split(text, '\n');
        for (std::string& line : lines)
            line = printable(line);
        context.out << joined(lines, "\n");
    }
    return ExitStatus::Done;
}

ExitStatus showRegistration(Context& context, const VerbOptions& options) {
    const RegistrationOptions& asked = options.registration;
    const Registration registration = registrationFor(asked, *context.connection.operations);
    std::vector<std::string> changed;
    if (asked.directory) changed = writeFiles(*asked.directory, registration.files);
    if (context.json) {
        printJson(context.out, documentOf(registration, asked.directory, changed));
        return ExitStatus::Done;
    }
    if (!asked.directory) show(context.out, registration.files);
    // Behind the files where both go to one terminal.
    context.out.flush();
    tell(context.error, registration, asked.directory, changed);
    return ExitStatus::Done;
}

}  // namespace cli
