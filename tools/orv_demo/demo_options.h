// The command line of orv_demo.
#pragma once

#include <string>
#include <vector>

#include "demo_session.h"

namespace orv_demo {

struct ParsedCommandLine {
    DemoOptions options;
    bool help = false;
    std::string error;  // not empty when the command line cannot be used
};

// Arguments without the program name.
ParsedCommandLine parseCommandLine(const std::vector<std::string>& args);

std::string usageText();

}  // namespace orv_demo
