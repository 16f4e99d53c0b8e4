// Reads the standards' figures in reference/*.csv (comment lines start with '#').
#pragma once

#include <fstream>
#include <limits>
#include <map>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

namespace level_library_test {

struct CsvTable {
    std::vector<std::string> columns;
    std::vector<std::vector<std::string>> rows;

    std::size_t column(const std::string& name) const {
        for (std::size_t i = 0; i < columns.size(); ++i) {
            if (columns[i] == name) return i;
        }
        throw std::runtime_error("no column " + name);
    }
    // "inf", "-inf" and "" (no value: NaN) are understood.
    double number(std::size_t row, const std::string& name) const {
        const std::string& text = rows[row].at(column(name));
        if (text.empty()) return std::numeric_limits<double>::quiet_NaN();
        if (text == "inf") return std::numeric_limits<double>::infinity();
        if (text == "-inf") return -std::numeric_limits<double>::infinity();
        return std::stod(text);
    }
    const std::string& text(std::size_t row, const std::string& name) const {
        return rows[row].at(column(name));
    }
};

inline CsvTable readReference(const std::string& file) {
    std::ifstream in(std::string(ORV_REFERENCE_DIR) + "/" + file);
    if (!in) throw std::runtime_error("cannot open reference file " + file);
    CsvTable t;
    std::string line;
    while (std::getline(in, line)) {
        if (!line.empty() && line.back() == '\r') line.pop_back();
        if (line.empty() || line[0] == '#') continue;
        std::vector<std::string> fields;
        std::stringstream ss(line);
        std::string field;
        while (std::getline(ss, field, ',')) fields.push_back(field);
        if (line.back() == ',') fields.emplace_back();
        if (t.columns.empty()) {
            t.columns = fields;
        } else {
            fields.resize(t.columns.size());
            t.rows.push_back(fields);
        }
    }
    return t;
}

}  // namespace level_library_test
