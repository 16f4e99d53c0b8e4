// report.json: every figure of the report, per session, under the names the pages use.
#pragma once

#include <string>

#include "figures.h"

namespace orv_report {

std::string reportJson(const Report& report);

}  // namespace orv_report
