// Helpers shared by the tests: temporary directories, files, and runs of the tool.
#pragma once

#include <string>
#include <vector>

#include "app/run_state.h"

namespace testing_support {

// A fresh directory under the system's temporary directory, removed with everything in
// it when the object goes away.
class TempDir {
public:
    TempDir();
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;
    ~TempDir();

    const std::string& path() const { return path_; }
    // path()/relative
    std::string operator/(const std::string& relative) const;

private:
    std::string path_;
};

// Creates the parent directories as needed.
void writeFile(const std::string& path, const std::string& content);
std::string readFile(const std::string& path);
void makeDirs(const std::string& path);
bool exists(const std::string& path);
// Names in a directory, sorted.
std::vector<std::string> listNames(const std::string& dir);

struct RunResult {
    int status = 0;
    std::string output;
};

// Runs the tool in this process with the given arguments (program name added), capturing
// everything it prints. Analysis workers run without the filter-error pause.
RunResult runTool(const std::vector<std::string>& args, int vectorStartupStatus = 0);
RunResult runTool(const std::vector<std::string>& args, const orv::RunEnvironment& environment);

// Runs the real orv_cmd executable and captures its standard output and exit status
// (the low 8 bits, as a shell sees them).
RunResult runToolProcess(const std::vector<std::string>& args);

// Restores the current directory when it goes out of scope.
class CurrentDirGuard {
public:
    CurrentDirGuard();
    ~CurrentDirGuard();

private:
    std::string saved_;
};

}  // namespace testing_support
