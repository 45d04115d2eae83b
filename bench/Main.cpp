// Prints the tables, all or those named, and writes them as JSON where asked.

#include <fmt/format.h>

#include <CLI/CLI.hpp>
#include <fstream>
#include <set>

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

}  // namespace

int main(int argc, char** argv) {
    CLI::App app("Measures the flash plug-in: counts, modelled time and processor time.");
    std::string jsonFile;
    std::vector<std::string> names;
    app.add_option("--json", jsonFile, "Write the tables to this file as well");
    std::set<std::string> known;
    for (const NamedTable& table : kTables)
        known.insert(table.name);
    app.add_option("tables", names, "The tables to make; all of them if none is named")
        ->check(CLI::IsMember(known));
    CLI11_PARSE(app, argc, argv);

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
