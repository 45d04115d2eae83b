#include "bench/Table.h"

#include <fmt/format.h>

#include <algorithm>
#include <cmath>

namespace bench {

namespace {

// Three digits that count; the JSON file has them all.
std::string CellText(const nlohmann::json& cell) {
    if (cell.is_string()) return cell.get<std::string>();
    if (!cell.is_number_float()) return cell.dump();
    const auto number = cell.get<double>();
    const int decimals =
        number == 0 ? 0 : 2 - static_cast<int>(std::floor(std::log10(std::fabs(number))));
    return fmt::format("{:.{}f}", number, std::clamp(decimals, 0, 6));
}

}  // namespace

Table::Table(std::string name, std::string title, std::vector<std::string> columns)
    : name_(std::move(name)), title_(std::move(title)), columns_(std::move(columns)) {}

void Table::Add(const std::vector<nlohmann::json>& row) {
    rows_.push_back(row);
}

void Table::Print() const {
    std::vector<std::size_t> widths;
    for (const std::string& column : columns_)
        widths.push_back(column.size());
    for (const auto& row : rows_) {
        for (std::size_t i = 0; i < row.size(); ++i)
            widths[i] = std::max(widths[i], CellText(row[i]).size());
    }
    const auto printRow = [&](const auto& row, const auto& text) {
        std::string line;
        for (std::size_t i = 0; i < row.size(); ++i) {
            line += i == 0 ? fmt::format("{:<{}}", text(row[i]), widths[i])
                           : fmt::format("  {:>{}}", text(row[i]), widths[i]);
        }
        fmt::print("{}\n", line);
    };
    fmt::print("\n== {}\n\n", title_);
    printRow(columns_, [](const std::string& column) { return column; });
    for (const auto& row : rows_)
        printRow(row, CellText);
}

void Table::AddTo(nlohmann::json& results) const {
    nlohmann::json& rows = results[name_] = nlohmann::json::array();
    for (const auto& row : rows_) {
        nlohmann::json& object = rows.emplace_back();
        for (std::size_t i = 0; i < row.size(); ++i)
            object[columns_[i]] = row[i];
    }
}

}  // namespace bench
