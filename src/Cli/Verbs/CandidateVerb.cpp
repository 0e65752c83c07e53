// SPDX-License-Identifier: Apache-2.0
// What shells complete a word to, where only the model knows it.
#include "Cli/Display/Output.h"
#include "Cli/Update/Inventory.h"
#include "Cli/Update/Jobs.h"
#include "Cli/Verbs/Verbs.h"

namespace cli {

ExitStatus showCandidates(Context& context, const VerbOptions& options) {
    const auto print = [&](const std::string& word, const std::string& description) {
        if (word.starts_with(options.candidates.prefix))
            context.out << printable(word) << '\t' << printable(description) << '\n';
    };
    core::CimOperations& operations = *context.connection.operations;
    if (options.candidates.kind == CandidateKind::Adapters)
        for (const Adapter& adapter : readAdapters(operations))
            print(adapter.name, adapter.pciAddress);
    if (options.candidates.kind == CandidateKind::Identities)
        for (const InventoryItem& item : readInventory(operations))
            if (item.isInstallable()) print(item.id, item.description);
    if (options.candidates.kind == CandidateKind::Jobs)
        for (const JobView& job : readJobs(operations))
            print(job.id, job.adapter);
    return ExitStatus::Done;
}

}  // namespace cli
