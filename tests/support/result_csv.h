// Readers of the tool's CSV result files for tests.
#pragma once

#include <string>
#include <vector>

namespace testing_support {

// The data rows of a result file (after the 21 header lines), as fields. Every line must
// end in CR LF.
std::vector<std::vector<std::string>> resultRows(const std::string& path);
// The 21 header lines (the header block and the column line), each still ending in CR.
std::vector<std::string> headerLines(const std::string& path);

}  // namespace testing_support
