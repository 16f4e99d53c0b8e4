#include "report_json.h"

#include <cstdio>

namespace orv_report {
namespace {

// Appends JSON text; commas between members and elements are placed by the writer.
class JsonWriter {
public:
    std::string text;

    void beginObject(const char* key = nullptr) { open(key, '{'); }
    void endObject() { close('}'); }
    void beginArray(const char* key = nullptr) { open(key, '['); }
    void endArray() { close(']'); }

    void string(const char* key, const std::string& v) {
        member(key);
        quoted(v);
    }
    void number(const char* key, double v) {
        member(key);
        text += formatFigure(v);
    }
    void number(const char* key, const std::optional<double>& v) {
        member(key);
        text += v ? formatFigure(*v) : "null";
    }
    void count(const char* key, std::size_t v) {
        member(key);
        text += std::to_string(v);
    }
    void boolean(const char* key, bool v) {
        member(key);
        text += v ? "true" : "false";
    }
    void null(const char* key) {
        member(key);
        text += "null";
    }

private:
    void member(const char* key) {
        if (needComma_) text += ',';
        needComma_ = true;
        if (key) {
            quoted(key);
            text += ':';
        }
    }
    void open(const char* key, char c) {
        member(key);
        text += c;
        needComma_ = false;
        ++depth_;
    }
    void close(char c) {
        text += c;
        if (--depth_ <= 2) text += '\n';  // one line per session
        needComma_ = true;
    }
    void quoted(const std::string& s) {
        text += '"';
        for (unsigned char c : s) {
            if (c == '"' || c == '\\') {
                text += '\\';
                text += static_cast<char>(c);
            } else if (c < 0x20) {
                char buf[8];
                std::snprintf(buf, sizeof buf, "\\u%04x", c);
                text += buf;
            } else {
                text += static_cast<char>(c);
            }
        }
        text += '"';
    }
    bool needComma_ = false;
    int depth_ = 0;
};

void figure(JsonWriter& w, const char* key, const Figure& f) {
    w.beginObject(key);
    w.number("level", f.level);
    w.number("coverage", f.coverage);
    w.boolean("flagged", f.flagged);
    w.endObject();
}

void strings(JsonWriter& w, const char* key, const std::vector<std::string>& v) {
    w.beginArray(key);
    for (const std::string& s : v) w.string(nullptr, s);
    w.endArray();
}

void ticks(JsonWriter& w, const char* key, const std::vector<Tick>& v) {
    w.beginArray(key);
    for (const Tick& t : v) w.string(nullptr, t.label);
    w.endArray();
}

void ranges(JsonWriter& w, const char* key, const Ranges& r) {
    w.beginObject(key);
    w.count("count", r.count);
    w.beginArray("ranges");
    for (const TimeRange& t : r.ranges) {
        w.beginArray();
        w.string(nullptr, formatTime(t.from, true));
        w.string(nullptr, formatTime(t.to, true));
        w.endArray();
    }
    w.endArray();
    w.endObject();
}

void timeAxis(JsonWriter& w, const TimeAxis& x) {
    w.string("from", formatTime(x.from, true));
    w.string("to", formatTime(x.to, true));
    ticks(w, "time_ticks", x.ticks);
    ticks(w, "day_marks", x.midnights);
}

void session(JsonWriter& w, const SessionReport& s) {
    w.beginObject();
    w.string("name", s.name);
    w.string("page", s.id + ".html");
    w.string("layout", s.layout);
    w.string("serial", s.serial);
    w.string("title", s.title);
    w.string("start", s.start);
    w.string("end", s.end);
    w.string("weighting", s.weighting);
    w.string("time_averaging", s.timeAveraging);
    w.count("statistical_interval_min", s.statsMinutes);
    w.count("short_leq_s", s.leqSeconds);
    strings(w, "files", s.files);
    strings(w, "unused_files", s.unusedFiles);
    strings(w, "problems", s.problems);
    w.boolean("empty", s.empty);
    figure(w, "Leq", s.leq);
    figure(w, "Lday", s.lday);
    figure(w, "Levening", s.levening);
    figure(w, "Lnight", s.lnight);
    figure(w, "Lden", s.lden);

    w.beginArray("days");
    for (const AssessmentDay& d : s.days) {
        w.beginObject();
        w.string("date", formatDate(d.midnight));
        figure(w, "Lday", d.lday);
        figure(w, "Levening", d.levening);
        figure(w, "Lnight", d.lnight);
        figure(w, "Lden", d.lden);
        w.number("night_Lmax", d.nightLmax);
        if (d.nightLmax)
            w.string("night_Lmax_at", formatTime(d.nightLmaxAt, false));
        else
            w.null("night_Lmax_at");
        w.endObject();
    }
    w.endArray();

    w.beginArray("hours");
    for (const HourFigure& h : s.hours) {
        w.beginObject();
        w.string("start", formatTime(h.start, false));
        figure(w, "Leq", h.leq);
        w.endObject();
    }
    w.endArray();

    const TimeHistory& th = s.history;
    w.beginObject("time_history");
    w.string("source", th.source);
    timeAxis(w, th.x);
    ticks(w, "level_ticks", th.y.ticks);
    w.beginArray("columns");
    for (const Column& c : th.columns) {
        w.beginObject();
        w.string("from", formatTime(c.from, true));
        w.number("Leq", c.leq);
        w.number("Lmax", c.lmax);
        w.number("L90", c.l90);
        w.endObject();
    }
    w.endArray();
    w.endObject();

    if (s.spectrum) {
        const Spectrum& sp = *s.spectrum;
        w.beginObject("spectrum");
        w.string("source", sp.source);
        w.string("weighting", sp.weighting);
        strings(w, "bands", sp.bands);
        w.beginArray("Leq");
        for (const auto& v : sp.leq) w.number(nullptr, v);
        w.endArray();
        w.beginArray("L90");
        for (const auto& v : sp.l90) w.number(nullptr, v);
        w.endArray();
        ticks(w, "level_ticks", sp.y.ticks);
        w.beginObject("band_time_map");
        timeAxis(w, sp.x);
        ticks(w, "colour_ticks", sp.colour.ticks);
        w.beginArray("columns");
        const std::size_t nb = sp.bands.size();
        for (std::size_t c = 0; c < sp.columns.size(); ++c) {
            w.beginArray();
            for (std::size_t b = 0; b < nb; ++b) w.number(nullptr, sp.cells[c * nb + b]);
            w.endArray();
        }
        w.endArray();
        w.endObject();
        w.endObject();
    } else {
        w.null("spectrum");
    }
    if (s.filtered) {
        w.beginObject("filtered_channel");
        w.string("name", s.filtered->name);
        w.string("weighting", s.filtered->weighting);
        w.number("Leq", s.filtered->leq);
        w.number("Lmax", s.filtered->lmax);
        w.number("Lpeak", s.filtered->lpeak);
        w.endObject();
    } else {
        w.null("filtered_channel");
    }

    const Quality& q = s.quality;
    w.beginObject("quality");
    strings(w, "flags", q.flags);
    ranges(w, "gaps", q.gaps);
    w.number("missing_minutes", q.missingMinutes);
    ranges(w, "errors", q.errors);
    ranges(w, "overloads", q.overloads);
    w.number("battery_min", q.batteryMin);
    w.count("battery_low_count", q.batteryLowCount);
    if (q.batteryLowFirst)
        w.string("battery_low_first", formatTime(*q.batteryLowFirst, false));
    else
        w.null("battery_low_first");
    w.number("temperature_min", q.temperatureMin);
    w.number("temperature_max", q.temperatureMax);
    w.count("temperature_out_count", q.temperatureOutCount);
    w.number("audio_max_difference", q.audioMaxDifference);
    w.count("audio_flagged", q.audioFlagged);
    w.beginArray("audio_hours");
    for (const AudioHour& a : q.audio) {
        w.beginObject();
        w.string("hour", formatTime(a.start, false));
        w.number("audio_Leq", a.audioLeq);
        w.number("logger_Leq", a.loggerLeq);
        w.number("audio_coverage", a.audioCoverage);
        w.number("logger_coverage", a.loggerCoverage);
        w.number("difference", a.difference);
        w.boolean("flagged", a.flagged);
        w.endObject();
    }
    w.endArray();
    w.endObject();
    w.endObject();
}

}  // namespace

std::string reportJson(const Report& report) {
    JsonWriter w;
    w.beginObject();
    w.string("results_dir", report.resultsDir);
    w.beginObject("thresholds");
    w.number("min_coverage", report.thresholds.minCoverage);
    w.number("battery_low", report.thresholds.batteryLow);
    w.number("temperature_low", report.thresholds.temperatureLow);
    w.number("temperature_high", report.thresholds.temperatureHigh);
    w.number("audio_tolerance", report.thresholds.audioTolerance);
    w.endObject();
    strings(w, "problems", report.problems);
    strings(w, "unused_files", report.unusedFiles);
    w.beginArray("sessions");
    for (const SessionReport& s : report.sessions) session(w, s);
    w.endArray();
    w.endObject();
    return w.text;
}

}  // namespace orv_report
