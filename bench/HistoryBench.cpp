// SPDX-License-Identifier: Apache-2.0
// Reading from a full history, and what a record costs an update beside the waiting for the disk.
#include <benchmark/benchmark.h>

#include "Framework/Requests/UpdateSink.h"
#include "History/Database.h"
#include "History/History.h"
#include "InstantAdapters.h"
#include "Support/TempFolder.h"
#include "Utils/Os/Linux/linux.h"

namespace {

constexpr std::int64_t kRecords = 100'000;

core::UpdateAttempt attempt() {
    return {.caller = {"alice", "192.0.2.1", "bench"},
            .time = os::getuSecondsSinceEpoch(),
            .monotonic = os::getMonotonicuSeconds(),
            .target = "root/cimv2:Quenx_EthernetPort.DeviceID=\"Quenx:port0\"",
            .adapter = "port0",
            .uri = "file:///srv/firmware/new.rom",
            .options = {5},
            .values = {},
            .image = {std::string(64, 'a'), 1 << 20, "IMG_PXE 2, IMG_UEFI 2"}};
}

/// A history with all the records that one keeps by default, one in ten a refusal.
class FullHistory {
  public:
    FullHistory() {
        const std::string folder = history::openFolder(m_folder / "history");
        const history::Store store(folder);
        history::Database(history::Store::fileIn(folder))
            .execute(
                "WITH RECURSIVE numbers(n) AS (SELECT 1 UNION ALL SELECT n + 1 FROM numbers WHERE n < " +
                std::to_string(kRecords) +
                ") INSERT INTO updates(begun, active, outcome, adapter, uri, sha256, boot, target) "
                "SELECT n, n, iif(n % 10 = 0, 'refused', 'written'), 'port' || (n % 50), "
                "'file:///srv/firmware/new.rom', hex(zeroblob(32)), hex(zeroblob(18)), hex(zeroblob(60)) "
                "FROM numbers");
    }
    std::vector<history::Record> find(const history::Filter& filter) { return m_history.find(filter); }

  private:
    const bench::InstantAdapters m_adapters{50};
    const test::TempFolder m_folder;
    history::History m_history{{.folder = [this] { return m_folder / "history"; }}};
};

void find(benchmark::State& state, const history::Filter& filter) {
    FullHistory history;
    std::size_t found = 0;
    for (auto _ : state)
        found = history.find(filter).size();
    state.counters["records"] = static_cast<double>(found);
}

void newest(benchmark::State& state) {
    find(state, {});
}
void failures(benchmark::State& state) {
    find(state, {.failedOnly = true});
}
void ofOneAdapter(benchmark::State& state) {
    find(state, {.adapter = "port7"});
}
void ofOneAdapterThatFailed(benchmark::State& state) {
    find(state, {.adapter = "port7", .failedOnly = true});
}
void after(benchmark::State& state) {
    find(state, {.after = kRecords - 1000});
}
void sinceTheLastDay(benchmark::State& state) {
    find(state, {.since = kRecords - 100});
}

/// From the beginning of a record to its end. Real time has the syncs in it, processor time has not.
void keepAnUpdate(benchmark::State& state) {
    const bench::InstantAdapters adapters(1);
    const test::TempFolder folder;
    history::History history({.folder = [&] { return folder / "history"; }});
    for (auto _ : state) {
        const auto record = history.begin(attempt());
        record->end(true, 0, "");
    }
}

BENCHMARK(newest)->MeasureProcessCPUTime()->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(failures)->MeasureProcessCPUTime()->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(ofOneAdapter)->MeasureProcessCPUTime()->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(ofOneAdapterThatFailed)->MeasureProcessCPUTime()->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(after)->MeasureProcessCPUTime()->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(sinceTheLastDay)->MeasureProcessCPUTime()->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(keepAnUpdate)->MeasureProcessCPUTime()->UseRealTime()->Unit(benchmark::kMillisecond);

}  // namespace
