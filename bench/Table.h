// A table of figures, printed for people and kept for JSON.

#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace bench {

class Table {
  public:
    /// `name` is the table's key in the JSON file.
    Table(std::string name, std::string title, std::vector<std::string> columns);

    /// A row has a text or a number for each column.
    void Add(const std::vector<nlohmann::json>& row);

    void Print() const;
    void AddTo(nlohmann::json& results) const;

  private:
    std::string name_;
    std::string title_;
    std::vector<std::string> columns_;
    std::vector<std::vector<nlohmann::json>> rows_;
};

}  // namespace bench
