#include "figures.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <map>

namespace orv_report {
namespace {

constexpr Seconds kHour = 3600, kDay = 86400;
constexpr std::size_t kHistoryColumns = 1000, kSpectrogramColumns = 240, kMaxRanges = 2000;
constexpr Seconds kDayStart = 7 * kHour, kEveningStart = 19 * kHour, kNightStart = 23 * kHour;

double power(double db) { return std::pow(10.0, db / 10.0); }
double decibel(double p) { return 10.0 * std::log10(p); }

Seconds floorDiv(Seconds a, Seconds b) { return a >= 0 ? a / b : -((-a + b - 1) / b); }

// Energy and covered seconds of a stretch of time.
struct Energy {
    double energy = 0, seconds = 0;
    void add(double p, double s) { energy += p * s, seconds += s; }
    void add(const Energy& o) { energy += o.energy, seconds += o.seconds; }
    std::optional<double> level() const {
        return seconds > 0 ? std::optional(decibel(energy / seconds)) : std::nullopt;
    }
};

// One row's stretch of time [from, to) and its power; power 0 when the row has no level
// (the writers put 0.0 for "no level").
struct Piece {
    Seconds from = 0, to = 0;
    double power = 0;
};

// Rows stamped with their end times, each `length` long; the first starts no earlier than
// `start`, so a session that begins inside an interval counts only the part recorded.
template <typename EndAt, typename LevelAt>
std::vector<Piece> piecesOf(std::size_t n, EndAt endAt, LevelAt levelAt, Seconds length,
                            Seconds start) {
    std::vector<Piece> out;
    out.reserve(n);
    Seconds prev = start;
    for (std::size_t i = 0; i < n; ++i) {
        const Seconds end = endAt(i);
        Seconds from = std::max(end - length, prev);
        if (from >= end) from = end - length;
        const double l = levelAt(i);
        out.push_back({from, end, l > 0 ? power(l) : 0.0});
        prev = end;
    }
    return out;
}

// Calls f(index, seconds) for the parts of [from, to) in the cells [origin + i step, + step).
template <typename F>
void spread(Seconds from, Seconds to, Seconds origin, Seconds step, F f) {
    while (from < to) {
        const Seconds i = floorDiv(from - origin, step);
        const Seconds seg = std::min(to, origin + (i + 1) * step) - from;
        f(i, seg);
        from += seg;
    }
}

Figure figureOf(const Energy& e, double periodSeconds, double minCoverage) {
    Figure f;
    if (const auto l = e.level()) f.level = round1(*l);
    f.coverage = periodSeconds > 0 ? round1(std::min(100.0, 100.0 * e.seconds / periodSeconds)) : 0;
    f.flagged = f.coverage < minCoverage;
    return f;
}

// Lden from the three period energies; its coverage is that of its worst-covered period.
Figure ldenOf(const Energy& d, const Energy& e, const Energy& n,
              const std::array<const Figure*, 3>& parts) {
    Figure f;
    const auto ld = d.level(), le = e.level(), ln = n.level();
    if (ld && le && ln) f.level = round1(lden(*ld, *le, *ln));
    f.coverage = std::min({parts[0]->coverage, parts[1]->coverage, parts[2]->coverage});
    f.flagged = !f.level ||
                std::any_of(parts.begin(), parts.end(), [](const Figure* p) { return p->flagged; });
    return f;
}

void addRange(Ranges& r, Seconds from, Seconds to) {
    ++r.count;
    if (!r.ranges.empty() && from <= r.ranges.back().to) {
        r.ranges.back().to = std::max(r.ranges.back().to, to);
    } else if (r.ranges.size() < kMaxRanges) {
        r.ranges.push_back({from, to});
    }
}

LevelAxis levelAxis(double lo, double hi, double step) {
    LevelAxis a;
    if (!(lo <= hi)) lo = 30, hi = 90;
    a.min = std::floor(lo / step) * step;
    a.max = std::max(std::ceil(hi / step) * step, a.min + 2 * step);
    for (double v = a.min; v <= a.max + 1e-9; v += step)
        a.ticks.push_back({v, std::to_string(static_cast<int>(v))});
    return a;
}

TimeAxis timeAxis(Seconds from, Seconds to) {
    static constexpr std::array<Seconds, 14> kSteps = {
        60,        120,       300,       600,        900,  1800,     kHour,
        2 * kHour, 3 * kHour, 6 * kHour, 12 * kHour, kDay, 2 * kDay, 7 * kDay};
    TimeAxis a;
    a.from = from, a.to = to;
    Seconds step = kSteps.back();
    for (Seconds s : kSteps)
        if ((to - from) / s <= 8) {
            step = s;
            break;
        }
    for (Seconds t = floorDiv(from + step - 1, step) * step; t <= to; t += step) {
        const std::string full = formatTime(t, false);  // "dd/mm/yyyy hh:mm"
        a.ticks.push_back(
            {static_cast<double>(t), step < kDay ? full.substr(11) : full.substr(0, 5)});
    }
    for (Seconds t = floorDiv(from, kDay) * kDay + kDay; t < to; t += kDay)
        a.midnights.push_back({static_cast<double>(t), formatTime(t, false).substr(0, 5)});
    return a;
}

// Columns of width `length` x k over [from, to), k the smallest that keeps them within max.
std::vector<Column> columnsOver(Seconds from, Seconds to, Seconds length, std::size_t max) {
    const Seconds origin = floorDiv(from, length) * length;
    const Seconds span = std::max<Seconds>(to - origin, length);
    const Seconds k =
        (span + length * static_cast<Seconds>(max) - 1) / (length * static_cast<Seconds>(max));
    const Seconds width = std::max<Seconds>(1, k) * length;
    std::vector<Column> c(static_cast<std::size_t>((span + width - 1) / width));
    for (std::size_t i = 0; i < c.size(); ++i)
        c[i].from = origin + static_cast<Seconds>(i) * width, c[i].to = c[i].from + width;
    return c;
}

// Energy means of pieces over the columns.
std::vector<Energy> columnEnergy(const std::vector<Piece>& pieces, const std::vector<Column>& c) {
    std::vector<Energy> e(c.size());
    if (c.empty()) return e;
    const Seconds origin = c[0].from, width = c[0].to - c[0].from;
    for (const Piece& p : pieces)
        if (p.power > 0)
            spread(p.from, p.to, origin, width, [&](Seconds i, Seconds s) {
                if (i >= 0 && static_cast<std::size_t>(i) < e.size())
                    e[static_cast<std::size_t>(i)].add(p.power, static_cast<double>(s));
            });
    return e;
}

std::optional<double> median(std::vector<double> v) {
    if (v.empty()) return std::nullopt;
    const std::size_t mid = v.size() / 2;
    std::nth_element(v.begin(), v.begin() + static_cast<long>(mid), v.end());
    double m = v[mid];
    if (v.size() % 2 == 0)
        m = (m + *std::max_element(v.begin(), v.begin() + static_cast<long>(mid))) / 2;
    return m;
}

std::vector<Piece> statPieces(const std::vector<StatRow>& rows, Seconds length, Seconds start,
                              float StatRow::*field) {
    return piecesOf(
        rows.size(), [&](std::size_t i) { return rows[i].end; },
        [&](std::size_t i) { return static_cast<double>(rows[i].*field); }, length, start);
}

struct SessionSpan {
    Seconds start = 0, end = 0;  // as the header states, widened to the data
};

void timeHistory(SessionReport& r, const std::vector<Piece>& finest, Seconds finestLength,
                 const ResultFile* general, Seconds generalLength, const SessionSpan& span) {
    TimeHistory& h = r.history;
    h.x = timeAxis(span.start, span.end);
    h.columns = columnsOver(span.start, span.end, finestLength, kHistoryColumns);
    const std::vector<Energy> leq = columnEnergy(finest, h.columns);
    std::vector<Energy> l90(h.columns.size());
    std::vector<std::optional<double>> lmax(h.columns.size());
    if (general && !h.columns.empty()) {
        const Seconds origin = h.columns[0].from, width = h.columns[0].to - origin;
        const std::vector<StatRow>& rows = general->stats;
        const std::vector<Piece> p = statPieces(rows, generalLength, span.start, &StatRow::lmax);
        for (std::size_t i = 0; i < rows.size(); ++i)
            spread(p[i].from, p[i].to, origin, width, [&](Seconds c, Seconds s) {
                if (c < 0 || static_cast<std::size_t>(c) >= lmax.size()) return;
                auto& m = lmax[static_cast<std::size_t>(c)];
                if (rows[i].lmax > 0) m = std::max(m.value_or(rows[i].lmax), double{rows[i].lmax});
                if (rows[i].l90 > 0) l90[static_cast<std::size_t>(c)].add(power(rows[i].l90), s);
            });
    }
    double lo = 1e9, hi = -1e9;
    for (std::size_t i = 0; i < h.columns.size(); ++i) {
        Column& c = h.columns[i];
        if (const auto l = leq[i].level()) c.leq = round1(*l);
        if (const auto l = l90[i].level()) c.l90 = round1(*l);
        if (lmax[i]) c.lmax = round1(*lmax[i]);
        for (const auto& v : {c.leq, c.l90, c.lmax})
            if (v) lo = std::min(lo, *v), hi = std::max(hi, *v);
    }
    h.y = levelAxis(lo, hi, 10);
}

void spectrum(SessionReport& r, const SessionFiles& s, const SessionSpan& span) {
    Spectrum sp;
    const ResultFile* oct = s.octaveLeq.empty() ? nullptr : &s.octaveLeq.front();
    const std::size_t nb = oct ? oct->leq.width : s.bands.size();
    if (nb == 0) return;
    std::vector<std::vector<Piece>> pieces(nb);
    Seconds length = 0;
    if (oct) {
        sp.source = "octave Leq file (" + std::to_string(oct->header.leqSeconds) + " s)";
        sp.weighting = oct->header.frequencyWeighting;
        length = std::max<Seconds>(1, oct->header.leqSeconds);
        for (std::size_t b = 0; b < nb; ++b) {
            sp.bands.push_back(oct->columns[2 + b]);
            pieces[b] = piecesOf(
                oct->leq.ends.size(), [&](std::size_t i) { return oct->leq.ends[i]; },
                [&](std::size_t i) { return double{oct->leq.levels[i * nb + b]}; }, length,
                span.start);
        }
    } else {
        sp.source = "octave band files";
        sp.weighting = s.bands[0].header.frequencyWeighting;
        length = std::max<Seconds>(60, s.bands[0].header.statsMinutes * 60);
        for (std::size_t b = 0; b < nb; ++b) {
            sp.bands.push_back(s.bands[b].label);
            pieces[b] = statPieces(s.bands[b].stats, length, span.start, &StatRow::leq);
        }
    }
    double lo = 1e9, hi = -1e9;
    for (std::size_t b = 0; b < nb; ++b) {
        Energy e;
        for (const Piece& p : pieces[b])
            if (p.power > 0) e.add(p.power, static_cast<double>(p.to - p.from));
        sp.leq.push_back(e.level() ? std::optional(round1(*e.level())) : std::nullopt);
        std::optional<double> l90;
        if (const ResultFile* band =
                b < s.bands.size() && s.bands.size() == nb ? &s.bands[b] : nullptr) {
            std::vector<double> v;
            for (const StatRow& row : band->stats)
                if (row.l90 > 0) v.push_back(row.l90);
            if (const auto m = median(v)) l90 = round1(*m);
        }
        sp.l90.push_back(l90);
        for (const auto& v : {sp.leq.back(), l90})
            if (v) lo = std::min(lo, *v), hi = std::max(hi, *v);
    }
    sp.y = levelAxis(std::min(lo, 0.0), hi, 10);
    sp.x = timeAxis(span.start, span.end);
    sp.columns = columnsOver(span.start, span.end, length, kSpectrogramColumns);
    sp.cells.resize(sp.columns.size() * nb);
    double cLo = 1e9, cHi = -1e9;
    for (std::size_t b = 0; b < nb; ++b) {
        const std::vector<Energy> e = columnEnergy(pieces[b], sp.columns);
        for (std::size_t c = 0; c < e.size(); ++c)
            if (const auto l = e[c].level()) {
                sp.cells[c * nb + b] = round1(*l);
                cLo = std::min(cLo, *l), cHi = std::max(cHi, *l);
            }
    }
    sp.colour = levelAxis(cLo, cHi, 10);
    r.spectrum = std::move(sp);
}

void filteredChannel(SessionReport& r, const ResultFile& f, const SessionSpan& span) {
    FilteredChannel fc;
    fc.name = f.label;
    fc.weighting = f.header.frequencyWeighting;
    const Seconds length = std::max<Seconds>(60, f.header.statsMinutes * 60);
    Energy e;
    for (const Piece& p : statPieces(f.stats, length, span.start, &StatRow::leq))
        if (p.power > 0) e.add(p.power, static_cast<double>(p.to - p.from));
    if (const auto l = e.level()) fc.leq = round1(*l);
    for (const StatRow& row : f.stats) {
        if (row.lmax > 0) fc.lmax = round1(std::max(fc.lmax.value_or(0), double{row.lmax}));
        if (row.lpeak > 0) fc.lpeak = round1(std::max(fc.lpeak.value_or(0), double{row.lpeak}));
    }
    r.filtered = fc;
}

}  // namespace

double round1(double x) {
    const double r = std::round(x * 10.0) / 10.0;
    return r == 0 ? 0.0 : r;  // no "-0.0"
}

std::string formatFigure(double x) {
    char buf[32];
    std::snprintf(buf, sizeof buf, "%.1f", round1(x));
    return buf;
}

double lden(double lday, double levening, double lnight) {
    return decibel((12.0 * power(lday) + 4.0 * power(levening + 5.0) + 8.0 * power(lnight + 10.0)) /
                   24.0);
}

SessionReport analyseSession(const SessionFiles& s, const Thresholds& th,
                             const std::vector<Problem>& problems) {
    SessionReport r;
    r.name = s.name;
    r.id = s.id;
    r.layout = s.binLayout ? "sub-directory (-bin)" : "flat";
    for (const Problem& p : problems) r.problems.push_back(describe(p));
    r.unusedFiles = s.unused;
    const auto listFile = [&](const ResultFile& f) { r.files.push_back(f.path); };
    if (s.general) listFile(*s.general);
    for (const auto* v : {&s.leq, &s.octaveLeq, &s.bands, &s.raw})
        for (const ResultFile& f : *v) listFile(f);
    if (s.filtered) listFile(*s.filtered);

    const ResultHeader* head = s.header();
    const ResultFile* general = s.general ? &*s.general : nullptr;
    const ResultFile* leqFile = s.leq.empty() ? nullptr : &s.leq.front();
    if (head) {
        r.serial = head->serial, r.title = head->title;
        r.start = head->startText, r.end = head->endText;
        r.weighting = (general ? general->header : *head).frequencyWeighting;
        r.timeAveraging = (general ? general->header : *head).timeAveraging;
        r.statsMinutes = general ? general->header.statsMinutes : 0;
        r.leqSeconds = leqFile ? leqFile->header.leqSeconds : 0;
    }

    // The finest Leq the files hold: the short Leq file, else the general results.
    const Seconds generalLength =
        general ? std::max<Seconds>(60, general->header.statsMinutes * 60) : 60;
    std::vector<Piece> finest;
    Seconds finestLength = generalLength;
    std::vector<std::uint8_t> finestOverload;
    SessionSpan span;
    const bool useLeq = leqFile && !leqFile->leq.ends.empty();
    const bool haveGeneral = general && !general->stats.empty();
    // The span of the session: as its header states, widened to every row of its files.
    std::optional<Seconds> first, last;
    const auto seen = [&](Seconds from, Seconds to) {
        first = std::min(first.value_or(from), from), last = std::max(last.value_or(to), to);
    };
    for (const ResultFile* f : {general, s.filtered ? &*s.filtered : nullptr})
        if (f && !f->stats.empty()) seen(f->stats.front().end, f->stats.back().end);
    for (const ResultFile& f : s.bands)
        if (!f.stats.empty()) seen(f.stats.front().end, f.stats.back().end);
    for (const auto* parts : {&s.leq, &s.octaveLeq})
        if (!parts->empty() && !parts->front().leq.ends.empty())
            seen(parts->front().leq.ends.front(), parts->front().leq.ends.back());
    // Hourly raw level files are read as whole hours (their records are not placed within
    // the hour): they set the span only when nothing else does.
    for (const ResultFile& f : s.raw)
        if (f.raw.records && !general && s.leq.empty())
            seen(f.raw.hourStart + kHour, f.raw.hourStart + kHour);
    r.empty = !first;
    if (r.empty) {
        r.quality.flags.push_back("no data");
        r.history.y = levelAxis(1, -1, 10);
        if (head && head->start && head->end) r.history.x = timeAxis(*head->start, *head->end);
        return r;
    }
    // A header time more than a day away from the rows is not believed (a damaged header
    // must not stretch the drawings and tables over years).
    const bool headStart =
        head && head->start && *first > *head->start && *first - *head->start <= kDay;
    const bool headEnd = head && head->end && *head->end > *last && *head->end - *last <= kDay;
    span.start = headStart ? *head->start : *first - finestLength;
    span.end = headEnd ? *head->end : *last;
    if (useLeq) {
        finestLength = std::max<Seconds>(1, leqFile->header.leqSeconds);
        r.history.source = "short Leq (" + std::to_string(finestLength) + " s)";
        const LeqRows& q = leqFile->leq;
        finest = piecesOf(
            q.ends.size(), [&](std::size_t i) { return q.ends[i]; },
            [&](std::size_t i) { return double{q.levels[i]}; }, finestLength, span.start);
    } else if (haveGeneral) {
        r.history.source = "interval Leq (" + std::to_string(generalLength / 60) + " min)";
        finest = statPieces(general->stats, generalLength, span.start, &StatRow::leq);
    }
    if (!finest.empty()) span.start = std::min(span.start, finest.front().from);

    // Energy per clock hour; every other period figure adds hours up.
    const Seconds hour0 = floorDiv(span.start, kHour) * kHour;
    const std::size_t hourCount = static_cast<std::size_t>(
        std::max<Seconds>(1, floorDiv(span.end - 1, kHour) * kHour - hour0 + kHour) / kHour);
    std::vector<Energy> hours(hourCount);
    Energy all;
    Quality& q = r.quality;
    Seconds prevTo = span.start;
    double missing = 0;
    for (const Piece& p : finest) {
        if (p.from > prevTo)
            addRange(q.gaps, prevTo, p.from), missing += static_cast<double>(p.from - prevTo);
        prevTo = std::max(prevTo, p.to);
        if (p.power <= 0) {
            addRange(q.gaps, p.from, p.to), missing += static_cast<double>(p.to - p.from);
            continue;
        }
        all.add(p.power, static_cast<double>(p.to - p.from));
        spread(p.from, p.to, hour0, kHour, [&](Seconds i, Seconds sec) {
            if (i >= 0 && static_cast<std::size_t>(i) < hours.size())
                hours[static_cast<std::size_t>(i)].add(p.power, static_cast<double>(sec));
        });
    }
    // An interval that had not ended when the data ended is never written: a shorter tail
    // is not missing data.
    if (!finest.empty() && span.end - prevTo >= finestLength)
        addRange(q.gaps, prevTo, span.end), missing += static_cast<double>(span.end - prevTo);
    q.missingMinutes = round1(missing / 60.0);

    const auto hourSum = [&](Seconds from, Seconds to) {
        Energy e;
        for (Seconds t = from; t < to; t += kHour) {
            const Seconds i = (t - hour0) / kHour;
            if (t >= hour0 && static_cast<std::size_t>(i) < hours.size())
                e.add(hours[static_cast<std::size_t>(i)]);
        }
        return e;
    };
    const double mc = th.minCoverage;
    r.leq = figureOf(all, static_cast<double>(span.end - span.start), mc);
    for (std::size_t i = 0; i < hours.size(); ++i)
        r.hours.push_back({hour0 + static_cast<Seconds>(i) * kHour, figureOf(hours[i], kHour, mc)});

    // Assessment days: the night from 23:00 to 07:00 belongs to the day it starts on.
    std::map<Seconds, AssessmentDay*> dayOf;
    for (Seconds d = floorDiv(span.start - kDayStart, kDay) * kDay;
         d <= floorDiv(span.end - 1 - kDayStart, kDay) * kDay; d += kDay) {
        AssessmentDay a;
        a.midnight = d;
        const Energy de = hourSum(d + kDayStart, d + kEveningStart),
                     ee = hourSum(d + kEveningStart, d + kNightStart),
                     ne = hourSum(d + kNightStart, d + kDay + kDayStart);
        a.lday = figureOf(de, 12 * kHour, mc);
        a.levening = figureOf(ee, 4 * kHour, mc);
        a.lnight = figureOf(ne, 8 * kHour, mc);
        a.lden = ldenOf(de, ee, ne, {&a.lday, &a.levening, &a.lnight});
        r.days.push_back(a);
    }
    for (AssessmentDay& a : r.days) dayOf[a.midnight] = &a;
    // Whole session: each period's energy over the period's time inside the session.
    Energy pe[3];
    double periodSeconds[3] = {0, 0, 0};
    const auto periodOf = [](Seconds t) {
        const Seconds clock = t - floorDiv(t, kDay) * kDay;
        return clock >= kDayStart && clock < kEveningStart     ? 0
               : clock >= kEveningStart && clock < kNightStart ? 1
                                                               : 2;
    };
    for (std::size_t i = 0; i < hours.size(); ++i) {
        const Seconds t = hour0 + static_cast<Seconds>(i) * kHour;
        pe[periodOf(t)].add(hours[i]);
        periodSeconds[periodOf(t)] += static_cast<double>(
            std::max<Seconds>(0, std::min(t + kHour, span.end) - std::max(t, span.start)));
    }
    r.lday = figureOf(pe[0], periodSeconds[0], mc);
    r.levening = figureOf(pe[1], periodSeconds[1], mc);
    r.lnight = figureOf(pe[2], periodSeconds[2], mc);
    r.lden = ldenOf(pe[0], pe[1], pe[2], {&r.lday, &r.levening, &r.lnight});

    // The general results: night maxima and the logger's condition.
    if (haveGeneral) {
        const std::vector<StatRow>& rows = general->stats;
        const std::vector<Piece> p = statPieces(rows, generalLength, span.start, &StatRow::leq);
        for (std::size_t i = 0; i < rows.size(); ++i) {
            const StatRow& row = rows[i];
            const Seconds t = row.end - 1;
            if (periodOf(t) == 2 && row.lmax > 0) {
                auto it = dayOf.find(floorDiv(t - kDayStart, kDay) * kDay);
                if (it != dayOf.end() &&
                    (!it->second->nightLmax || round1(row.lmax) > *it->second->nightLmax))
                    it->second->nightLmax = round1(row.lmax), it->second->nightLmaxAt = row.end;
            }
            if (row.errors)
                addRange(q.errors, p[i].from, p[i].to);
            else if (row.overload)
                addRange(q.overloads, p[i].from, p[i].to);
            if (row.battery > 0) {
                q.batteryMin = round1(std::min(q.batteryMin.value_or(1e9), double{row.battery}));
                if (row.battery < th.batteryLow && q.batteryLowCount++ == 0)
                    q.batteryLowFirst = row.end;
            }
            q.temperatureMin =
                round1(std::min(q.temperatureMin.value_or(1e9), double{row.temperature}));
            q.temperatureMax =
                round1(std::max(q.temperatureMax.value_or(-1e9), double{row.temperature}));
            if (row.temperature < th.temperatureLow || row.temperature > th.temperatureHigh)
                ++q.temperatureOutCount;
        }
    }
    if (useLeq) {
        const LeqRows& lq = leqFile->leq;
        for (std::size_t i = 0; i < lq.ends.size(); ++i)
            if (lq.overload[i] && !lq.errors[i])
                addRange(q.overloads, finest[i].from, finest[i].to);
    }

    // Hourly Leq of the audio against the logger's, where both cover the hour alike.
    const bool weightC = r.weighting == "C";
    std::map<Seconds, RawHour> rawHours;
    for (const ResultFile& f : s.raw) {
        RawHour& h = rawHours[f.raw.hourStart];
        h.records += f.raw.records;
        h.energyA += f.raw.energyA, h.energyC += f.raw.energyC;
        h.levelsA += f.raw.levelsA, h.levelsC += f.raw.levelsC;
    }
    for (const auto& [start, raw] : rawHours) {
        const double energy = weightC ? raw.energyC : raw.energyA;
        const std::size_t n = weightC ? raw.levelsC : raw.levelsA;
        const Energy logger = hourSum(start, start + kHour);
        if (n == 0 || !logger.level()) continue;
        AudioHour a;
        a.start = start;
        a.audioLeq = round1(decibel(energy / static_cast<double>(n)));
        a.loggerLeq = round1(*logger.level());
        a.audioCoverage = round1(100.0 * static_cast<double>(raw.records) / 36000.0);
        a.loggerCoverage = round1(100.0 * logger.seconds / kHour);
        const double audioSeconds = static_cast<double>(raw.records) / 10.0;
        if (std::abs(audioSeconds - logger.seconds) <= std::max(2.0, 0.02 * logger.seconds)) {
            a.difference = round1(decibel(energy / static_cast<double>(n)) - *logger.level());
            a.flagged = std::abs(*a.difference) > th.audioTolerance;
            q.audioFlagged += a.flagged;
            q.audioMaxDifference =
                std::max(q.audioMaxDifference.value_or(0), std::abs(*a.difference));
        }
        q.audio.push_back(a);
    }

    if (!finest.empty()) {
        timeHistory(r, finest, finestLength, haveGeneral ? general : nullptr, generalLength, span);
    } else {
        r.history.x = timeAxis(span.start, span.end);
        r.history.y = levelAxis(1, -1, 10);
    }
    spectrum(r, s, span);
    if (s.filtered && !s.filtered->stats.empty()) filteredChannel(r, *s.filtered, span);

    if (finest.empty()) q.flags.push_back("no broadband data");
    if (q.gaps.count) q.flags.push_back("gaps");
    if (q.errors.count) q.flags.push_back("errors");
    if (q.overloads.count) q.flags.push_back("overload");
    if (q.batteryLowCount) q.flags.push_back("battery");
    if (q.temperatureOutCount) q.flags.push_back("temperature");
    if (q.audioFlagged) q.flags.push_back("audio");
    if (!finest.empty() && r.leq.flagged) q.flags.push_back("coverage");
    if (!r.problems.empty()) q.flags.push_back("input");
    return r;
}

}  // namespace orv_report
