// SPDX-License-Identifier: Apache-2.0
// Who holds which adapter.
#include <algorithm>

#include "Cli/Connection/ServerControl.h"
#include "Cli/Display/Records.h"
#include "Cli/Update/ServedLog.h"
#include "Cli/Verbs/Verbs.h"

namespace cli {

namespace {

/// All that is known of one adapter's updates.
struct AdapterStatus {
    const Adapter& adapter;
    const HeldAdapter* held = nullptr;        ///< null for none
    const JobView* running = nullptr;         ///< likewise
    const JobView* last = nullptr;            ///< that has ended; likewise
    const history::Record* record = nullptr;  ///< of the last attempt that has ended; likewise

    std::string holder() const {
        if (held != nullptr) return held->text();
        if (running != nullptr) return running->id;
        if (!adapter.writer.empty()) return adapter.writer;
        return adapter.busy ? "another process" : "-";
    }
    std::string since() const {
        return momentText(held != nullptr ? held->since : running != nullptr ? running->start : std::nullopt);
    }
    /// "Running, 42 %"
    std::string progress() const {
        if (running == nullptr) return "-";
        const std::optional<unsigned> percent = running->certainPercent();
        return running->stateName() + (percent ? ", " + std::to_string(*percent) + " %" : "");
    }
    /// "active (new.rom of 2026-11-21 20:10:33 +0100)" by the history, which knows more than the jobs; else
    /// "Completed (Quenx:FirmwareUpdate@Job#1 of 2026-11-21 20:10:33)".
    std::string outcome() const {
        if (record != nullptr) {
            return outcomeText(*record) + " (" + record->uri.substr(record->uri.rfind('/') + 1) + " of " +
                   localTimeText(record->begun) + ")" + (record->reason.empty() ? "" : ": " + record->reason);
        }
        if (last == nullptr) return "-";
        return last->stateName() + " (" + last->id + " of " + momentText(last->start) + ")" +
               (last->errorDescription.empty() ? "" : ": " + last->errorDescription);
    }
};

void to_json(Json& json, const AdapterStatus& status) {
    json = {{"name", status.adapter.name},
            {"backend", status.adapter.backend},
            {"claim", nullptr},
            {"busy", status.adapter.busy},
            {"writer", status.adapter.writer},
            {"job", nullptr},
            {"lastJob", nullptr},
            {"lastUpdate", nullptr}};
    if (status.held != nullptr) json["claim"] = *status.held;
    if (status.running != nullptr) json["job"] = *status.running;
    if (status.last != nullptr) json["lastJob"] = *status.last;
    if (status.record != nullptr) json["lastUpdate"] = *status.record;
}

std::vector<AdapterStatus> statusOf(const std::vector<Adapter>& adapters, const std::vector<JobView>& jobs,
                                    const std::vector<history::Record>& records,
                                    const std::optional<HeldAdapter>& held) {
    std::vector<AdapterStatus> all;
    for (const Adapter& adapter : adapters) {
        AdapterStatus& status = all.emplace_back(AdapterStatus{adapter});
        if (held && held->adapter == adapter.name) status.held = &*held;
        // Jobs are listed in the order in which they were started.
        for (const JobView& job : jobs)
            if (job.adapter == adapter.name) (job.hasEnded() ? status.last : status.running) = &job;
        // The newest comes first.
        const auto found = std::ranges::find_if(records, [&adapter](const history::Record& record) {
            return record.adapter == adapter.name && !record.isRunning();
        });
        if (found != records.end()) status.record = &*found;
    }
    return all;
}

/// None where nobody keeps them, or a server does not serve them.
std::vector<history::Record> recordsOf(const Connection& connection) try {
    return readHistory(connection, {});
} catch (const NoAnswer&) {
    throw;
} catch (const CommandError&) {
    return {};
} catch (const core::CimError&) {
    return {};
}

void printStatus(std::ostream& out, const std::vector<AdapterStatus>& all) {
    Rows rows = {{"ADAPTER", "HELD BY", "SINCE", "JOB", "LAST OUTCOME"}};
    for (const AdapterStatus& each : all)
        rows.push_back({labelOf(each.adapter.name, each.adapter.backend), each.holder(), each.since(),
                        each.progress(), each.outcome()});
    printTable(out, rows);
}

/// The name of an adapter, which may be one that is not there any more.
std::string nameOf(const Connection& connection, const std::string& adapter) try {
    return findAdapter(connection, adapter).name;
} catch (const CommandError& error) {
    const std::optional<HeldAdapter> held = connection.control->held();
    if (error.status() != ExitStatus::NotFound || !held || held->adapter != adapter) throw;
    return adapter;
}

[[noreturn]] void refuseOtherServer() {
    throw CommandError(ExitStatus::Failed, "This server has no way to free an adapter.",
                       "Restart it: what a check holds ends with the process.");
}

}  // namespace

ExitStatus showStatus(Context& context, const VerbOptions&) {
    const Connection& connection = context.connection;
    const std::vector<Adapter> adapters = readAdapters(*connection.operations);
    const std::vector<JobView> jobs =
        connection.isInProcess ? std::vector<JobView>() : readJobs(*connection.operations);
    const auto held = connection.control == nullptr ? std::nullopt : connection.control->held();
    const std::vector<history::Record> records = recordsOf(connection);
    const std::vector<AdapterStatus> all = statusOf(adapters, jobs, records, held);
    if (context.json) {
        printJson(context.out, {{"adapters", all}, {"claimsTold", connection.isInProcess || held}});
        return ExitStatus::Done;
    }
    printStatus(context.out, all);
    if (held && !held->adapter.empty() && !held->isNeeded)
        context.out << printable("What holds " + held->adapter +
                                 " has ended. Free it with \"quenxctl release " + held->adapter + "\".")
                    << '\n';
    if (!held && !connection.isInProcess) context.out << "This server does not tell what its checks hold.\n";
    return ExitStatus::Done;
}

ExitStatus releaseAdapter(Context& context, const VerbOptions& options) {
    const Connection& connection = context.connection;
    if (connection.control == nullptr)
        throw CommandError(ExitStatus::WrongUse,
                           "Checks hold an adapter on a server, and none was named: this program holds none.",
                           "Name the server with --server. Root needs none on a machine on which quenx-cimd "
                           "runs.");
    const std::string adapter = nameOf(connection, options.adapter);
    const std::optional<bool> released = connection.control->release(adapter);
    if (!released) refuseOtherServer();
    if (context.json)
        printJson(context.out, {{"adapter", adapter}, {"released", *released}});
    else
        context.out << printable(adapter) << (*released ? " is free again.\n" : " was not held.\n");
    return ExitStatus::Done;
}

}  // namespace cli
