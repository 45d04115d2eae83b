// Cases that stand in a text file beside their test, as rows of a table or as scenarios. In both,
// a line that begins with "#" is a comment.

#pragma once

#include <fstream>
#include <map>
#include <ostream>
#include <stdexcept>
#include <string>
#include <vector>

namespace test {

/// The lines of a file that aren't empty and no comments.
inline std::vector<std::string> ReadLines(const std::string& file) {
    std::ifstream stream(TESTS_DIRECTORY "/" + file);
    std::vector<std::string> lines;
    for (std::string line; std::getline(stream, line);)
        if (const auto begin = line.find_first_not_of(' ');
            begin != line.npos && line[begin] != '#')
            lines.push_back(line);
    if (lines.empty()) throw std::runtime_error(file + " has no cases");
    return lines;
}

inline std::vector<std::string> Split(const std::string& text, const std::string& separator) {
    std::vector<std::string> parts;
    for (std::size_t begin = 0, end = 0; end != text.npos; begin = end + separator.size()) {
        end = text.find(separator, begin);
        parts.push_back(text.substr(begin, end - begin));
    }
    return parts;
}

/// A text in which \n, \r, \t and \xNN stand for such characters.
inline std::string Unescaped(const std::string& text) {
    std::string plain;
    for (std::size_t i = 0; i < text.size(); ++i) {
        if (text[i] != '\\') {
            plain += text[i];
        } else if (text.at(++i) == 'x') {
            plain += static_cast<char>(std::stoi(text.substr(i + 1, 2), nullptr, 16));
            i += 2;
        } else {
            plain += text[i] == 'n' ? '\n' : text[i] == 'r' ? '\r' : '\t';
        }
    }
    return plain;
}

/// Rows with columns between " | ": as many as asked for, "" for those that are left out.
inline std::vector<std::vector<std::string>> ReadTable(const std::string& file,
                                                       std::size_t columns) {
    std::vector<std::vector<std::string>> rows;
    for (const std::string& line : ReadLines(file)) {
        rows.push_back(Split(line, " | "));
        if (rows.back().size() > columns) throw std::runtime_error("too many columns: " + line);
        rows.back().resize(columns);
    }
    return rows;
}

/// A table of keys and texts.
inline std::map<std::string, std::string> ReadSettings(const std::string& file) {
    std::map<std::string, std::string> settings;
    for (const auto& row : ReadTable(file, 2))
        settings[row[0]] = row[1];
    return settings;
}

/// A line "NAME: DEVICE", and steps in lines that are indented.
struct Scenario {
    std::string name;
    std::string device;
    std::vector<std::string> steps;
};

inline void PrintTo(const Scenario& scenario, std::ostream* out) {
    *out << scenario.name;
}

inline std::vector<Scenario> ReadScenarios(const std::string& file) {
    std::vector<Scenario> scenarios;
    for (const std::string& line : ReadLines(file)) {
        const auto colon = line.find(": ");
        if (line.starts_with("  "))
            scenarios.back().steps.push_back(line.substr(2));
        else
            scenarios.push_back({line.substr(0, colon), line.substr(colon + 2), {}});
    }
    return scenarios;
}

}  // namespace test
