#include "html_pages.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>

namespace orv_report {
namespace {

constexpr const char* kStyle = R"(
body{font:13px/1.4 "DejaVu Sans",Arial,sans-serif;margin:24px auto;max-width:1060px;color:#222;padding:0 12px}
h1{font-size:20px;margin:0 0 8px} h2{font-size:16px;border-bottom:1px solid #bbb;margin:26px 0 8px;padding-bottom:2px}
h3{font-size:13px;margin:14px 0 4px}
table{border-collapse:collapse;margin:4px 0} td,th{padding:2px 6px;border:1px solid #ddd;text-align:right;vertical-align:top}
th{background:#f2f2f2;font-weight:600} .l{text-align:left}
.flag{background:#fde0c2} .cov{color:#666;font-size:11px} .note{color:#555;font-size:12px}
.hours td,.hours th{font-size:10px;padding:1px 2px;min-width:24px;text-align:center}
.hours td.low{font-style:italic;opacity:.55}
.bad{color:#b00020} .ok{color:#1b6e20}
svg{width:100%;height:auto;display:block;margin:4px 0}
svg text{font:11px "DejaVu Sans",Arial,sans-serif;fill:#333}
.legend span{display:inline-block;margin-right:14px}
.sw{display:inline-block;width:12px;height:10px;margin-right:4px;vertical-align:middle}
@page{size:A4;margin:12mm}
@media print{body{margin:0;max-width:none;font-size:10px;padding:0} h2{break-after:avoid}
 svg,table,.legend,.keep{break-inside:avoid} a{color:inherit;text-decoration:none}}
)";

std::string esc(const std::string& s) {
    std::string out;
    for (char c : s) {
        switch (c) {
            case '&':
                out += "&amp;";
                break;
            case '<':
                out += "&lt;";
                break;
            case '>':
                out += "&gt;";
                break;
            case '"':
                out += "&quot;";
                break;
            default:
                out += c;
        }
    }
    return out;
}

// Coordinates in SVG attributes (geometry, not figures).
std::string px(double v) {
    char buf[24];
    std::snprintf(buf, sizeof buf, "%.1f", v);
    return buf;
}

std::string fig(const std::optional<double>& v) { return v ? formatFigure(*v) : "&ndash;"; }

// A level with its coverage beside it; flagged cells are marked.
std::string figureCell(const Figure& f, const char* extraClass = "") {
    std::string cls = std::string(extraClass) + (f.flagged ? " flag" : "");
    return "<td class=\"" + cls + "\">" + fig(f.level) + " <span class=\"cov\">(" +
           formatFigure(f.coverage) + " %)</span></td>";
}

// Colours of a level scale, low to high (a perceptually even ramp).
std::string colourOf(double v, double lo, double hi) {
    static constexpr std::array<std::array<double, 3>, 6> kStops = {{{68, 1, 84},
                                                                     {65, 68, 135},
                                                                     {42, 120, 142},
                                                                     {34, 168, 132},
                                                                     {122, 209, 81},
                                                                     {253, 231, 37}}};
    double t = hi > lo ? std::clamp((v - lo) / (hi - lo), 0.0, 1.0) : 0.5;
    t *= kStops.size() - 1;
    const std::size_t i = std::min<std::size_t>(static_cast<std::size_t>(t), kStops.size() - 2);
    const double f = t - static_cast<double>(i);
    char buf[8];
    std::snprintf(buf, sizeof buf, "#%02x%02x%02x",
                  static_cast<unsigned>(kStops[i][0] + f * (kStops[i + 1][0] - kStops[i][0])),
                  static_cast<unsigned>(kStops[i][1] + f * (kStops[i + 1][1] - kStops[i][1])),
                  static_cast<unsigned>(kStops[i][2] + f * (kStops[i + 1][2] - kStops[i][2])));
    return buf;
}

struct Frame {
    double left = 48, right = 968, top = 12, bottom = 250;
    double from = 0, to = 1, lo = 0, hi = 1;
    double x(double t) const {
        return left + (t - from) / std::max(1e-9, to - from) * (right - left);
    }
    double y(double v) const {
        return bottom - (v - lo) / std::max(1e-9, hi - lo) * (bottom - top);
    }
};

void levelGrid(std::string& svg, const Frame& f, const LevelAxis& a) {
    for (const Tick& t : a.ticks) {
        const std::string y = px(f.y(t.at));
        svg += "<line x1=\"" + px(f.left) + "\" x2=\"" + px(f.right) + "\" y1=\"" + y + "\" y2=\"" +
               y + "\" stroke=\"#e4e4e4\"/><text x=\"" + px(f.left - 6) + "\" y=\"" + y +
               "\" dy=\"4\" text-anchor=\"end\">" + esc(t.label) + "</text>";
    }
    svg += "<text x=\"12\" y=\"" + px((f.top + f.bottom) / 2) + "\" transform=\"rotate(-90 12 " +
           px((f.top + f.bottom) / 2) + ")\" text-anchor=\"middle\">dB</text>";
}

void timeGrid(std::string& svg, const Frame& f, const TimeAxis& a) {
    const bool timesOfDay =
        !a.ticks.empty() && a.ticks.front().label.find('/') == std::string::npos;
    for (const Tick& t : a.ticks)
        svg += "<text x=\"" + px(f.x(t.at)) + "\" y=\"" + px(f.bottom + 15) +
               "\" text-anchor=\"middle\">" + esc(t.label) + "</text>";
    for (const Tick& m : a.midnights) {
        const std::string x = px(f.x(m.at));
        svg += "<line x1=\"" + x + "\" x2=\"" + x + "\" y1=\"" + px(f.top) + "\" y2=\"" +
               px(f.bottom) + "\" stroke=\"#777\" stroke-dasharray=\"4 3\"/>";
        if (timesOfDay)
            svg += "<text x=\"" + x + "\" y=\"" + px(f.bottom + 29) + "\" text-anchor=\"middle\">" +
                   esc(m.label) + "</text>";
    }
    svg += "<rect x=\"" + px(f.left) + "\" y=\"" + px(f.top) + "\" width=\"" +
           px(f.right - f.left) + "\" height=\"" + px(f.bottom - f.top) +
           "\" fill=\"none\" stroke=\"#999\"/>";
}

// A step line through the columns' values; a column without a value breaks it.
std::string stepPath(const Frame& f, const std::vector<Column>& cols,
                     std::optional<double> Column::*field, const char* colour, double width) {
    std::string d;
    bool open = false;
    for (const Column& c : cols) {
        const auto& v = c.*field;
        if (!v) {
            open = false;
            continue;
        }
        const std::string y = px(f.y(std::clamp(*v, f.lo, f.hi)));
        d += (open ? "L" : "M") + px(f.x(static_cast<double>(c.from))) + " " + y + "L" +
             px(f.x(static_cast<double>(c.to))) + " " + y;
        open = true;
    }
    return d.empty() ? ""
                     : "<path d=\"" + d + "\" fill=\"none\" stroke=\"" + colour +
                           "\" stroke-width=\"" + px(width) + "\"/>";
}

void shade(std::string& svg, const Frame& f, const Ranges& r, const char* colour, bool marks) {
    for (const TimeRange& t : r.ranges) {
        const double x0 = f.x(static_cast<double>(t.from)), x1 = f.x(static_cast<double>(t.to));
        const double w = std::max(marks ? 2.0 : 1.0, x1 - x0);
        if (marks)
            svg += "<rect x=\"" + px(x0) + "\" y=\"" + px(f.top) + "\" width=\"" + px(w) +
                   "\" height=\"8\" fill=\"" + colour + "\"/>";
        else
            svg += "<rect x=\"" + px(x0) + "\" y=\"" + px(f.top) + "\" width=\"" + px(w) +
                   "\" height=\"" + px(f.bottom - f.top) + "\" fill=\"" + colour + "\"/>";
    }
}

std::string timeHistorySvg(const SessionReport& s) {
    const TimeHistory& h = s.history;
    Frame f;
    f.from = static_cast<double>(h.x.from), f.to = static_cast<double>(h.x.to);
    f.lo = h.y.min, f.hi = h.y.max;
    std::string svg = "<svg viewBox=\"0 0 1000 290\" role=\"img\" aria-label=\"time history\">";
    shade(svg, f, s.quality.gaps, "#d9d9d9", false);
    shade(svg, f, s.quality.errors, "#f6c48f", false);
    levelGrid(svg, f, h.y);
    timeGrid(svg, f, h.x);
    svg += stepPath(f, h.columns, &Column::lmax, "#d62728", 0.8);
    svg += stepPath(f, h.columns, &Column::leq, "#1f4e9c", 1.2);
    svg += stepPath(f, h.columns, &Column::l90, "#2ca02c", 1.0);
    shade(svg, f, s.quality.overloads, "#b00020", true);
    return svg + "</svg>";
}

std::string spectrumSvg(const Spectrum& sp) {
    const std::size_t nb = sp.bands.size();
    Frame f;
    f.bottom = 230;
    f.lo = sp.y.min, f.hi = sp.y.max;
    std::string svg = "<svg viewBox=\"0 0 1000 285\" role=\"img\" aria-label=\"band spectrum\">";
    levelGrid(svg, f, sp.y);
    const double step = (f.right - f.left) / static_cast<double>(nb);
    for (std::size_t b = 0; b < nb; ++b) {
        const double x = f.left + step * static_cast<double>(b);
        if (sp.leq[b]) {
            const double y = f.y(std::clamp(*sp.leq[b], f.lo, f.hi));
            svg += "<rect x=\"" + px(x + step * 0.15) + "\" y=\"" + px(y) + "\" width=\"" +
                   px(step * 0.7) + "\" height=\"" + px(f.bottom - y) + "\" fill=\"#4f7cc4\"/>";
        }
        if (sp.l90[b]) {
            const std::string y = px(f.y(std::clamp(*sp.l90[b], f.lo, f.hi)));
            svg += "<line x1=\"" + px(x + step * 0.1) + "\" x2=\"" + px(x + step * 0.9) +
                   "\" y1=\"" + y + "\" y2=\"" + y + "\" stroke=\"#2ca02c\" stroke-width=\"3\"/>";
        }
        const std::string lx = px(x + step / 2), ly = px(f.bottom + 8);
        svg += "<text x=\"" + lx + "\" y=\"" + ly + "\" transform=\"rotate(-60 " + lx + " " + ly +
               ")\" text-anchor=\"end\">" + esc(sp.bands[b]) + "</text>";
    }
    svg += "<rect x=\"" + px(f.left) + "\" y=\"" + px(f.top) + "\" width=\"" +
           px(f.right - f.left) + "\" height=\"" + px(f.bottom - f.top) +
           "\" fill=\"none\" stroke=\"#999\"/>";
    return svg + "</svg>";
}

std::string bandTimeMapSvg(const Spectrum& sp) {
    const std::size_t nb = sp.bands.size();
    Frame f;
    f.bottom = 250;
    f.from = static_cast<double>(sp.x.from), f.to = static_cast<double>(sp.x.to);
    std::string svg = "<svg viewBox=\"0 0 1000 330\" role=\"img\" aria-label=\"band by time map\">";
    const double rowH = (f.bottom - f.top) / static_cast<double>(nb);
    const std::size_t labelEvery = nb > 12 ? 3 : 1;
    // One rectangle per run of cells of equal colour along a band.
    for (std::size_t b = 0; b < nb; ++b) {
        const double y = f.bottom - rowH * static_cast<double>(b + 1);
        std::string runColour;
        double runFrom = 0, runTo = 0;
        const auto flush = [&] {
            if (!runColour.empty())
                svg += "<rect x=\"" + px(runFrom) + "\" y=\"" + px(y) + "\" width=\"" +
                       px(runTo - runFrom + 0.3) + "\" height=\"" + px(rowH + 0.3) + "\" fill=\"" +
                       runColour + "\"/>";
            runColour.clear();
        };
        for (std::size_t c = 0; c < sp.columns.size(); ++c) {
            const auto& v = sp.cells[c * nb + b];
            const double x0 = f.x(static_cast<double>(sp.columns[c].from));
            const double x1 = std::min(f.right, f.x(static_cast<double>(sp.columns[c].to)));
            const std::string colour =
                v ? colourOf(std::round(*v), sp.colour.min, sp.colour.max) : "";
            if (colour != runColour || x0 > runTo + 0.01) flush();
            if (colour.empty()) continue;
            if (runColour.empty()) runColour = colour, runFrom = std::max(f.left, x0);
            runTo = x1;
        }
        flush();
        if (b % labelEvery == 0)
            svg += "<text x=\"" + px(f.left - 4) + "\" y=\"" + px(y + rowH / 2) +
                   "\" dy=\"4\" text-anchor=\"end\">" + esc(sp.bands[b]) + "</text>";
    }
    timeGrid(svg, f, sp.x);
    // Colour scale.
    const double barY = 292, barL = 600, barR = 988;
    for (int i = 0; i < 50; ++i) {
        const double v = sp.colour.min + (sp.colour.max - sp.colour.min) * (i + 0.5) / 50.0;
        svg += "<rect x=\"" + px(barL + (barR - barL) * i / 50.0) + "\" y=\"" + px(barY) +
               "\" width=\"" + px((barR - barL) / 50.0 + 0.3) + "\" height=\"10\" fill=\"" +
               colourOf(v, sp.colour.min, sp.colour.max) + "\"/>";
    }
    for (const Tick& t : sp.colour.ticks)
        svg += "<text x=\"" +
               px(barL + (barR - barL) * (t.at - sp.colour.min) /
                             std::max(1e-9, sp.colour.max - sp.colour.min)) +
               "\" y=\"" + px(barY + 24) + "\" text-anchor=\"middle\">" + esc(t.label) + "</text>";
    svg += "<text x=\"" + px(barL - 8) + "\" y=\"" + px(barY + 9) +
           "\" text-anchor=\"end\">Band Leq, dB</text>";
    return svg + "</svg>";
}

std::string rangeList(const char* title, const Ranges& r) {
    if (r.ranges.empty()) return "";
    constexpr std::size_t kShown = 20;
    std::string h = "<h3>" + std::string(title) +
                    "</h3><table><tr><th class=\"l\">from</th><th class=\"l\">to</th></tr>";
    for (std::size_t i = 0; i < std::min(kShown, r.ranges.size()); ++i)
        h += "<tr><td class=\"l\">" + formatTime(r.ranges[i].from, true) + "</td><td class=\"l\">" +
             formatTime(r.ranges[i].to, true) + "</td></tr>";
    h += "</table>";
    if (r.ranges.size() > kShown)
        h += "<p class=\"note\">and further ranges (report.json lists them)</p>";
    return h;
}

std::string flagsText(const std::vector<std::string>& flags) {
    if (flags.empty()) return "<span class=\"ok\">none</span>";
    std::string t;
    for (const std::string& f : flags) t += (t.empty() ? "" : ", ") + esc(f);
    return "<span class=\"bad\">" + t + "</span>";
}

std::string page(const std::string& title, const std::string& body) {
    return "<!DOCTYPE html>\n<html lang=\"en\"><head><meta charset=\"utf-8\"><title>" + esc(title) +
           "</title><style>" + kStyle + "</style></head><body>\n" + body + "</body></html>\n";
}

std::string headerTable(const SessionReport& s) {
    std::string h = "<table>";
    const auto row = [&](const char* k, const std::string& v) {
        h += "<tr><th class=\"l\">" + std::string(k) + "</th><td class=\"l\">" + esc(v) +
             "</td></tr>";
    };
    row("Logger serial", s.serial);
    row("Title", s.title);
    row("Started", s.start);
    row("Stopped", s.end);
    row("Frequency weighting", s.weighting);
    row("Time averaging", s.timeAveraging);
    row("Statistical interval", s.statsMinutes ? std::to_string(s.statsMinutes) + " min" : "–");
    row("Short Leq length", s.leqSeconds ? std::to_string(s.leqSeconds) + " s" : "–");
    row("Output layout", s.layout);
    // A band set is 12 or 36 files: the first few stand for the rest (report.json lists all).
    constexpr std::size_t kListed = 6;
    std::string files;
    for (std::size_t i = 0; i < std::min(kListed, s.files.size()); ++i)
        files.append(files.empty() ? "" : "\n").append(s.files[i]);
    if (s.files.size() > kListed) files.append("\n... and more (report.json lists every file)");
    h += "<tr><th class=\"l\">Files read</th><td class=\"l\" style=\"white-space:pre-line\">" +
         esc(files) + "</td></tr></table>";
    return h;
}

std::string periodsSection(const SessionReport& s, const Report& report) {
    std::string h =
        "<h2>Assessment periods</h2><p class=\"note\">Day 07&ndash;19, evening 19&ndash;23, "
        "night 23&ndash;07 (the night belongs to the day it starts on); energy means of "
        "the " +
        esc(s.history.source) + "; coverage in brackets, shaded below " +
        formatFigure(report.thresholds.minCoverage) +
        " %. Lden = 10 lg((12&middot;10<sup>Lday/10</sup> + 4&middot;10<sup>(Levening+5)/10</sup>"
        " + 8&middot;10<sup>(Lnight+10)/10</sup>)/24).</p>";
    h += "<table><tr><th class=\"l\">whole session</th><th>Leq</th><th>Lday</th><th>Levening</th>"
         "<th>Lnight</th><th>Lden</th></tr><tr><td class=\"l\">" +
         esc(s.start) + " &ndash; " + esc(s.end) + "</td>" + figureCell(s.leq) +
         figureCell(s.lday) + figureCell(s.levening) + figureCell(s.lnight) + figureCell(s.lden) +
         "</tr></table>";
    h += "<h3>Per day</h3><table><tr><th "
         "class=\"l\">day</th><th>Lday</th><th>Levening</th><th>Lnight</th>"
         "<th>Lden</th><th>night Lmax</th><th class=\"l\">at</th></tr>";
    for (const AssessmentDay& d : s.days)
        h += "<tr><td class=\"l\">" + formatDate(d.midnight) + "</td>" + figureCell(d.lday) +
             figureCell(d.levening) + figureCell(d.lnight) + figureCell(d.lden) + "<td>" +
             fig(d.nightLmax) + "</td><td class=\"l\">" +
             (d.nightLmax ? formatTime(d.nightLmaxAt, false) : "") + "</td></tr>";
    h += "</table>";

    // Hourly Leq: one row per date, one column per hour.
    h += "<h3>Hourly Leq</h3><table class=\"hours\"><tr><th class=\"l\">date</th>";
    char hh[4];
    for (int i = 0; i < 24; ++i) {
        std::snprintf(hh, sizeof hh, "%02d", i);
        h += std::string("<th>") + hh + "</th>";
    }
    h += "</tr>";
    double lo = 1e9, hi = -1e9;
    for (const HourFigure& f : s.hours)
        if (f.leq.level) lo = std::min(lo, *f.leq.level), hi = std::max(hi, *f.leq.level);
    std::string date;
    int next = 24;
    for (const HourFigure& f : s.hours) {
        const std::string d = formatDate(f.start);
        const int hour = static_cast<int>((f.start % 86400) / 3600);
        if (d != date) {
            for (; next < 24 && !date.empty(); ++next) h += "<td></td>";
            if (!date.empty()) h += "</tr>";
            h += "<tr><td class=\"l\">" + d + "</td>";
            date = d;
            next = 0;
        }
        for (; next < hour; ++next) h += "<td></td>";
        const bool light = f.leq.level && *f.leq.level > lo + (hi - lo) * 0.6;
        h += f.leq.level ? "<td class=\"" + std::string(f.leq.flagged ? "low" : "") +
                               "\" style=\"background:" + colourOf(*f.leq.level, lo, hi) +
                               ";color:" + (light ? "#000" : "#fff") + "\">" +
                               formatFigure(*f.leq.level) + "</td>"
                         : "<td></td>";
        next = hour + 1;
    }
    for (; next < 24 && !date.empty(); ++next) h += "<td></td>";
    if (!date.empty()) h += "</tr>";
    h += "</table><p class=\"note\">Hours covered below " +
         formatFigure(report.thresholds.minCoverage) + " % are shown faint.</p>";
    return h;
}

std::string qualitySection(const SessionReport& s, const Report& report) {
    const Quality& q = s.quality;
    const Thresholds& t = report.thresholds;
    std::string h =
        "<h2>Data quality</h2><table><tr><th class=\"l\">check</th><th "
        "class=\"l\">result</th></tr>";
    const auto row = [&](const char* k, const std::string& v, bool bad) {
        h += "<tr><td class=\"l\">" + std::string(k) + "</td><td class=\"l" + (bad ? " flag" : "") +
             "\">" + v + "</td></tr>";
    };
    row("Missing data",
        std::to_string(q.gaps.count) + " gap(s), " + formatFigure(q.missingMinutes) + " min",
        q.gaps.count > 0);
    row("Intervals with errors", std::to_string(q.errors.count), q.errors.count > 0);
    row("Overloaded intervals", std::to_string(q.overloads.count), q.overloads.count > 0);
    row("Battery",
        q.batteryMin
            ? "lowest " + formatFigure(*q.batteryMin) + " V; " + std::to_string(q.batteryLowCount) +
                  " interval(s) below " + formatFigure(t.batteryLow) + " V" +
                  (q.batteryLowFirst ? ", first " + formatTime(*q.batteryLowFirst, false) : "")
            : "no reading",
        q.batteryLowCount > 0);
    row("Temperature",
        q.temperatureMin
            ? formatFigure(*q.temperatureMin) + " to " + formatFigure(*q.temperatureMax) +
                  " &deg;C; " + std::to_string(q.temperatureOutCount) + " interval(s) outside " +
                  formatFigure(t.temperatureLow) + " to " + formatFigure(t.temperatureHigh) +
                  " &deg;C"
            : "no reading",
        q.temperatureOutCount > 0);
    std::size_t compared = 0;
    for (const AudioHour& a : q.audio) compared += a.difference.has_value();
    row("Audio against logger",
        q.audio.empty() ? "no hourly level files from the audio"
                        : std::to_string(compared) + " hour(s) compared, largest difference " +
                              fig(q.audioMaxDifference) + " dB, " + std::to_string(q.audioFlagged) +
                              " beyond " + formatFigure(t.audioTolerance) + " dB",
        q.audioFlagged > 0);
    h += "</table>";
    h += rangeList("Gaps (no data)", q.gaps) + rangeList("Intervals with errors", q.errors) +
         rangeList("Overloads", q.overloads);
    if (!q.audio.empty()) {
        h += "<h3>Hourly Leq from the audio and from the logger</h3><table><tr><th "
             "class=\"l\">hour</th>"
             "<th>audio</th><th>logger</th><th>audio coverage</th><th>logger "
             "coverage</th><th>difference</th></tr>";
        for (const AudioHour& a : q.audio)
            h +=
                "<tr><td class=\"l\">" + formatTime(a.start, false) + "</td><td>" +
                formatFigure(a.audioLeq) + "</td><td>" + formatFigure(a.loggerLeq) + "</td><td>" +
                formatFigure(a.audioCoverage) + " %</td><td>" + formatFigure(a.loggerCoverage) +
                " %</td><td class=\"" + (a.flagged ? "flag" : "") + "\">" +
                (a.difference ? formatFigure(*a.difference) : "not compared (different coverage)") +
                "</td></tr>";
        h += "</table>";
    }
    if (!s.problems.empty()) {
        h += "<h3>Input problems</h3><ul>";
        for (const std::string& p : s.problems) h += "<li>" + esc(p) + "</li>";
        h += "</ul>";
    }
    if (!s.unusedFiles.empty()) {
        h += "<h3>Files of this session not shown (other settings)</h3><ul>";
        for (const std::string& p : s.unusedFiles) h += "<li>" + esc(p) + "</li>";
        h += "</ul>";
    }
    return h;
}

}  // namespace

std::string sessionPage(const SessionReport& s, const Report& report) {
    std::string b =
        "<p><a href=\"index.html\">&larr; all sessions</a></p><h1>Session " + esc(s.name) + "</h1>";
    b += headerTable(s);
    if (s.empty) {
        b += "<h2>No data</h2><p class=\"bad\">This session's result files hold no rows, so there "
             "is "
             "nothing to show.</p>";
        return page("Session " + s.name, b + qualitySection(s, report));
    }
    b += "<div class=\"keep\"><h2>Time history</h2>" + timeHistorySvg(s);
    b += "<p class=\"legend\"><span><i class=\"sw\" style=\"background:#1f4e9c\"></i>Leq: " +
         esc(s.history.source) +
         "</span><span><i class=\"sw\" style=\"background:#d62728\"></i>Lmax per interval"
         "</span><span><i class=\"sw\" style=\"background:#2ca02c\"></i>L90 per interval</span>"
         "<span><i class=\"sw\" style=\"background:#d9d9d9\"></i>no data</span>"
         "<span><i class=\"sw\" style=\"background:#f6c48f\"></i>errors found in interval</span>"
         "<span><i class=\"sw\" style=\"background:#b00020\"></i>overload</span>"
         "<span>dashed: midnight</span></p></div>";
    b += periodsSection(s, report);
    if (s.spectrum) {
        const Spectrum& sp = *s.spectrum;
        b += "<div class=\"keep\"><h2>Spectrum</h2><p class=\"note\">Frequency weighting " +
             esc(sp.weighting) + "; from the " + esc(sp.source) +
             ". Bars: energy mean of the band Leq over the session; green marks: "
             "median of the interval L90 of each band.</p>" +
             spectrumSvg(sp) + "</div><h3>Band Leq over time</h3>" + bandTimeMapSvg(sp);
    }
    if (s.filtered)
        b += "<h3>Filtered channel " + esc(s.filtered->name) +
             "</h3><table><tr><th>Leq</th><th>highest Lmax</th>"
             "<th>highest Lpeak</th></tr><tr><td>" +
             fig(s.filtered->leq) + "</td><td>" + fig(s.filtered->lmax) + "</td><td>" +
             fig(s.filtered->lpeak) + "</td></tr></table>";
    b += qualitySection(s, report);
    return page("Session " + s.name, b);
}

std::string indexPage(const Report& report) {
    std::string b = "<h1>Sessions in " + esc(report.resultsDir) + "</h1>";
    if (report.sessions.empty())
        b += "<p class=\"bad\">No result files of orv_cmd were found here.</p>";
    else
        b += "<table><tr><th class=\"l\">session</th><th class=\"l\">started</th><th "
             "class=\"l\">stopped</th>"
             "<th class=\"l\">weighting</th><th>Lden</th><th>Leq</th><th "
             "class=\"l\">flags</th></tr>";
    for (const SessionReport& s : report.sessions)
        b += "<tr><td class=\"l\"><a href=\"" + esc(s.id) + ".html\">" + esc(s.name) +
             "</a></td><td class=\"l\">" + esc(s.start) + "</td><td class=\"l\">" + esc(s.end) +
             "</td><td class=\"l\">" + esc(s.weighting) + "</td>" + figureCell(s.lden) +
             figureCell(s.leq) + "<td class=\"l\">" + flagsText(s.quality.flags) + "</td></tr>";
    if (!report.sessions.empty()) b += "</table>";
    b += "<p class=\"note\">Coverage in brackets; shaded below " +
         formatFigure(report.thresholds.minCoverage) + " %. Figures in report.json.</p>";
    if (!report.problems.empty()) {
        b += "<h2>Input problems</h2><ul>";
        for (const std::string& p : report.problems) b += "<li>" + esc(p) + "</li>";
        b += "</ul>";
    }
    if (!report.unusedFiles.empty()) {
        b += "<h2>Files that belong to no session</h2><ul>";
        for (const std::string& p : report.unusedFiles) b += "<li>" + esc(p) + "</li>";
        b += "</ul>";
    }
    return page("Session report", b);
}

}  // namespace orv_report
