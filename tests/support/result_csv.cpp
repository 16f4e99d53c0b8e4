#include "support/result_csv.h"

#include <gtest/gtest.h>

#include <sstream>

#include "support/test_support.h"

namespace testing_support {
namespace {

// The quoted fields of one CSV line.
std::vector<std::string> csvFields(const std::string& line) {
    std::vector<std::string> out;
    std::size_t i = 0;
    while (i < line.size()) {
        if (line[i] != '"') break;
        const std::size_t end = line.find('"', i + 1);
        out.push_back(line.substr(i + 1, end - i - 1));
        i = end + 2;  // past the quote and the comma
    }
    return out;
}

}  // namespace

std::vector<std::vector<std::string>> resultRows(const std::string& path) {
    std::istringstream in(readFile(path));
    std::string line;
    std::vector<std::vector<std::string>> out;
    for (int n = 0; std::getline(in, line); ++n) {
        EXPECT_FALSE(line.empty() || line.back() != '\r') << "line " << n << " of " << path;
        if (n >= 21) out.push_back(csvFields(line));
    }
    return out;
}

std::vector<std::string> headerLines(const std::string& path) {
    std::istringstream in(readFile(path));
    std::vector<std::string> out;
    std::string line;
    while (out.size() < 21 && std::getline(in, line)) out.push_back(line);
    return out;
}

}  // namespace testing_support
