// The report's pages: one per session and an index. Self-contained HTML (inline CSS and SVG,
// no script, nothing from the network) that prints on A4. Every number on a page is taken
// from the report's figures.
#pragma once

#include <string>

#include "figures.h"

namespace orv_report {

std::string sessionPage(const SessionReport& session, const Report& report);
std::string indexPage(const Report& report);

}  // namespace orv_report
