// Prints the tables, all or those named, and writes them as JSON where asked.

#include <fmt/format.h>

#include <algorithm>
#include <fstream>
#include <string>
#include <vector>

#include "bench/Measurements.h"
#include "bench/support/Workloads.h"

namespace bench {

Table CountsTable() {
    Table table("counts", "Host calls by kind, beside the least that the protocol allows",
                {"work", "bytes", "address", "settings", "reads", "writes", "control", "pauses",
                 "display", "calls", "least", "ratio", "bytes in", "bytes out", "paused ms"});
    for (const test::Workload& work : test::CountedWorkloads()) {
        const test::Counts counts = test::CountCalls(work);
        std::vector<nlohmann::json> row = {work.name, work.sizeBytes,
                                           fmt::format("0x{:x}", work.address)};
        row.insert(row.end(), counts.calls.begin(), counts.calls.end());
        const double ratio =
            static_cast<double>(counts.Calls()) / static_cast<double>(work.leastCalls);
        row.insert(row.end(), {counts.Calls(), work.leastCalls, ratio, counts.bytesRead,
                               counts.bytesWritten, counts.pausedMs});
        table.Add(row);
    }
    return table;
}

}  // namespace bench

namespace {

struct NamedTable {
    const char* name;
    bench::Table (*make)();
};

constexpr NamedTable kTables[] = {
    {"counts", bench::CountsTable},   {"model", bench::ModelledTimeTable},
    {"tool", bench::ToolTable},       {"starts", bench::StartsTable},
    {"packets", bench::PacketsTable}, {"own", bench::OwnWorkTable},
    {"growth", bench::GrowthTable},   {"throughput", bench::ThroughputTable}};

/// Names the tables, for those who have asked for none of them.
int ShowUsage() {
    fmt::print(stderr, "usage: corvane_bench [--json FILE] [TABLE]...\ntables:");
    for (const NamedTable& table : kTables)
        fmt::print(stderr, " {}", table.name);
    fmt::print(stderr, "\n");
    return 2;
}

bool IsTable(const std::string& name) {
    return std::ranges::find(kTables, name, &NamedTable::name) != std::end(kTables);
}

}  // namespace

int main(int argc, char** argv) {
    std::vector<std::string> names(argv + 1, argv + argc);
    std::string jsonFile;
    if (const auto option = std::ranges::find(names, "--json"); option != names.end()) {
        if (option + 1 == names.end()) return ShowUsage();
        jsonFile = option[1];
        names.erase(option, option + 2);
    }
    if (!std::ranges::all_of(names, IsTable)) return ShowUsage();

    nlohmann::json results;
    for (const auto& [name, make] : kTables) {
        if (!names.empty() && std::ranges::find(names, name) == names.end()) continue;
        const bench::Table table = make();
        table.Print();
        table.AddTo(results);
    }
    if (jsonFile.empty()) return 0;
    std::ofstream file(jsonFile);
    file << results.dump(2) << '\n';
    if (file.flush()) return 0;
    fmt::print(stderr, "{}: the results can't be written; check directory and permissions\n",
               jsonFile);
    return 1;
}
