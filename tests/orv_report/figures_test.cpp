// The figures of a session from generated result files with known levels: energy means,
// the Lden penalties, period boundaries at 07, 19, 23 and midnight, coverage of sessions that
// start and end inside a period, quality flags, the audio-against-logger check, drawing
// columns averaged by energy, and the spectrum.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "generated_results.h"
#include "orv_report/figures.h"

namespace orv_report {
namespace {

using namespace report_test;

ResultFile fromText(const std::string& text) {
    std::vector<Problem> problems;
    ResultFile f = classifyFile("f.csv", text, problems);
    readRows(f, text, problems);
    EXPECT_TRUE(problems.empty()) << describe(problems.front());
    return f;
}

// A session of a general file with rows every `minutes`, level by end time.
template <typename Level>
SessionFiles generalSession(const Header& h, Seconds firstEnd, Level level) {
    std::vector<Row> rows;
    for (Seconds t = firstEnd; t <= h.end; t += h.statsMinutes * 60) {
        Row r{t};
        r.leq = level(t);
        r.lmax = r.leq + 10;
        rows.push_back(r);
    }
    SessionFiles s;
    s.name = s.id = "S";
    s.general = fromText(statFile(StatKind::General, "", h, rows));
    return s;
}

SessionFiles leqSession(const Header& h, Seconds step, double (*level)(Seconds)) {
    SessionFiles s;
    s.name = s.id = "S";
    Header lh = h;
    lh.leqLength = std::to_string(step) + " sec";
    s.leq.push_back(fromText(leqFile(lh, {}, leqRows(h.start, h.end, step, level))));
    return s;
}

void expectFigure(const Figure& f, std::optional<double> level, double coverage, bool flagged) {
    EXPECT_EQ(f.level, level);
    EXPECT_DOUBLE_EQ(f.coverage, coverage);
    EXPECT_EQ(f.flagged, flagged);
}

const Thresholds kThresholds;

TEST(AssessmentPeriods, EnergyMeansAndPenalties) {
    // Day 60, evening 55, night 50 dB for two whole days: with the +5 and +10 dB penalties
    // every full day's Lden is exactly 60.0; without them it would be the 57.7 of the Leq.
    Header h;
    h.start = at(0, 0), h.end = at(2, 0);
    const SessionReport r =
        analyseSession(leqSession(h, 60,
                                  [](Seconds t) {
                                      const Seconds c = (t - 1) % 86400;
                                      return c >= 7 * 3600 && c < 19 * 3600    ? 60.0
                                             : c >= 19 * 3600 && c < 23 * 3600 ? 55.0
                                                                               : 50.0;
                                  }),
                       kThresholds, {});
    ASSERT_EQ(r.days.size(), 3U);  // 04/03 holds the night that ends at 07:00 on 05/03
    expectFigure(r.days[0].lnight, 50.0, 87.5, false);
    expectFigure(r.days[0].lday, std::nullopt, 0, true);
    expectFigure(r.days[0].lden, std::nullopt, 0, true);
    expectFigure(r.days[1].lday, 60.0, 100, false);
    expectFigure(r.days[1].levening, 55.0, 100, false);
    expectFigure(r.days[1].lnight, 50.0, 100, false);
    expectFigure(r.days[1].lden, 60.0, 100, false);
    expectFigure(r.days[2].lnight, 50.0, 12.5, true);  // 23:00-24:00 only
    expectFigure(r.days[2].lden, 60.0, 12.5, true);
    expectFigure(r.leq, 57.7, 100, false);
    expectFigure(r.lday, 60.0, 100, false);
    expectFigure(r.lden, 60.0, 100, false);
    ASSERT_EQ(r.hours.size(), 48U);
    EXPECT_EQ(r.hours[7].leq.level, 60.0);
    EXPECT_EQ(r.hours[6].leq.level, 50.0);
}

TEST(AssessmentPeriods, BoundariesAt07_19_23AndMidnight) {
    // 1-minute intervals of 40 dB from 06:00 to 08:00 the next day; the interval ending at T
    // reads 90 dB and the one after it 80 dB. An interval stamped T lies before T.
    struct Case {
        int day, hour;
        // (period figure, expected level) pairs
        std::vector<std::pair<const Figure* (*)(const SessionReport&), double>> expect;
    };
    const auto night0 = [](const SessionReport& r) { return &r.days[0].lnight; };
    const auto day1 = [](const SessionReport& r) { return &r.days[1].lday; };
    const auto evening1 = [](const SessionReport& r) { return &r.days[1].levening; };
    const auto night1 = [](const SessionReport& r) { return &r.days[1].lnight; };
    const auto hour23 = [](const SessionReport& r) { return &r.hours[17].leq; };  // 05/03 23:00
    const auto hour00 = [](const SessionReport& r) { return &r.hours[18].leq; };  // 06/03 00:00
    const std::vector<Case> cases = {
        {0, 7, {{night0, 72.2}, {day1, 51.7}}},
        {0, 19, {{day1, 61.5}, {evening1, 56.3}}},
        {0, 23, {{evening1, 66.2}, {night1, 53.4}}},
        {1, 0, {{night1, 63.6}, {hour23, 72.2}, {hour00, 62.2}}},
    };
    Header h;
    h.start = at(0, 6), h.end = at(1, 8), h.statsMinutes = 1;
    for (const Case& c : cases) {
        SCOPED_TRACE(c.hour);
        const Seconds t = at(c.day, c.hour);
        const SessionReport r =
            analyseSession(generalSession(h, at(0, 6, 1),
                                          [&](Seconds end) {
                                              return end == t ? 90.0 : end == t + 60 ? 80.0 : 40.0;
                                          }),
                           kThresholds, {});
        ASSERT_EQ(r.days.size(), 3U);
        for (const auto& [figure, level] : c.expect) EXPECT_EQ(figure(r)->level, level);
        if (c.day == 1) {  // the loudest minute of the night is the one ending at midnight
            EXPECT_EQ(r.days[1].nightLmax, 100.0);
            EXPECT_EQ(r.days[1].nightLmaxAt, t);
        }
    }
}

TEST(AssessmentPeriods, SessionStartingAndEndingInsidePeriods) {
    // 15-minute intervals from 12:58:30 to 20:10: the first interval counts its 90 s, the
    // 10 minutes after 20:00 never closed an interval and are not missing data.
    Header h;
    h.start = at(0, 12, 58, 30), h.end = at(0, 20, 10);
    const SessionReport r =
        analyseSession(generalSession(h, at(0, 13), [](Seconds) { return 50.0; }), kThresholds, {});
    ASSERT_EQ(r.days.size(), 1U);
    expectFigure(r.days[0].lday, 50.0, 50.2, true);      // 6:01:30 of 12 h
    expectFigure(r.days[0].levening, 50.0, 25.0, true);  // 1 h of 4 h
    expectFigure(r.lday, 50.0, 100, false);              // all the day time the session had
    expectFigure(r.levening, 50.0, 85.7, false);         // 60 of the 70 minutes
    expectFigure(r.lnight, std::nullopt, 0, true);
    expectFigure(r.leq, 50.0, 97.7, false);
    EXPECT_DOUBLE_EQ(r.hours[0].leq.coverage, 2.5);
    EXPECT_EQ(r.quality.gaps.count, 0U);
}

TEST(DataQuality, GapsErrorsOverloadsBatteryTemperature) {
    Header h;  // 12:00-14:00, 15-minute intervals
    std::vector<Row> rows;
    for (Seconds t = at(0, 12, 15); t <= h.end; t += 900) rows.push_back({t});
    rows[1].leq = 0;                              // 12:30: no level
    rows[3].errors = true, rows[3].overload = 1;  // 13:00
    rows[4].overload = 1;                         // 13:15
    rows.erase(rows.begin() + 5);                 // 13:30 missing
    rows[5].battery = 11.2;                       // 13:45
    rows[6].temperature = 55;                     // 14:00
    SessionFiles s;
    s.general = fromText(statFile(StatKind::General, "", h, rows));
    const SessionReport r = analyseSession(s, kThresholds, {});
    const Quality& q = r.quality;
    ASSERT_EQ(q.gaps.ranges.size(), 2U);
    EXPECT_EQ(q.gaps.ranges[0].from, at(0, 12, 15));
    EXPECT_EQ(q.gaps.ranges[1].to, at(0, 13, 30));
    EXPECT_DOUBLE_EQ(q.missingMinutes, 30.0);
    ASSERT_EQ(q.errors.ranges.size(), 1U);
    EXPECT_EQ(q.errors.ranges[0].from, at(0, 12, 45));
    ASSERT_EQ(q.overloads.ranges.size(), 1U);
    EXPECT_EQ(q.overloads.ranges[0].to, at(0, 13, 15));
    EXPECT_EQ(q.batteryMin, 11.2);
    EXPECT_EQ(q.batteryLowCount, 1U);
    EXPECT_EQ(q.batteryLowFirst, at(0, 13, 45));
    EXPECT_EQ(q.temperatureMax, 55.0);
    EXPECT_EQ(q.temperatureOutCount, 1U);
    EXPECT_EQ(q.flags,
              (std::vector<std::string>{"gaps", "errors", "overload", "battery", "temperature"}));
    expectFigure(r.leq, 50.0, 75.0, false);
}

TEST(DataQuality, AudioAgainstLoggerPerHour) {
    Header h;  // 12:00-13:30: the file of hour 13 must not stretch the session to 14:00
    h.end = at(0, 13, 30);
    SessionFiles s = leqSession(h, 1, [](Seconds) { return 60.0; });
    const auto raw = [](Seconds hour, std::size_t n, double level) {
        return fromText(rawFile("Site", "TL40217", hour, std::vector<double>(n, level)));
    };
    s.raw = {raw(at(0, 12), 36000, 61.2), raw(at(0, 13), 600, 60.0)};
    const SessionReport r = analyseSession(s, kThresholds, {});
    const Quality& q = r.quality;
    ASSERT_EQ(q.audio.size(), 2U);
    EXPECT_EQ(q.audio[0].difference, 1.2);  // a calibration 1.2 dB off shows here
    EXPECT_TRUE(q.audio[0].flagged);
    EXPECT_DOUBLE_EQ(q.audio[0].loggerLeq, 60.0);
    EXPECT_FALSE(q.audio[1].difference);  // ten minutes of audio against a whole hour
    EXPECT_DOUBLE_EQ(q.audio[1].audioCoverage, 1.7);
    EXPECT_EQ(q.audioFlagged, 1U);
    EXPECT_EQ(q.flags, std::vector<std::string>{"audio"});
}

TEST(TimeHistory, ColumnsAreEnergyMeans) {
    // 2000 s of 1-s Leqs alternating 50 and 70 dB are drawn in 1000 columns of 2 s: each
    // column is 67.0 dB, the energy mean, never 60 (dB averaged) or a picked sample.
    Header h;
    h.start = at(0, 12), h.end = at(0, 12, 33, 20), h.statsMinutes = 1;
    SessionFiles s = leqSession(h, 1, [](Seconds t) { return t % 2 ? 50.0 : 70.0; });
    std::vector<Row> rows;
    for (Seconds t = at(0, 12, 1); t <= h.end; t += 60)
        rows.push_back({t, 67, 80 + static_cast<double>((t / 60) % 5)});
    s.general = fromText(statFile(StatKind::General, "", h, rows));
    const SessionReport r = analyseSession(s, kThresholds, {});
    const TimeHistory& th = r.history;
    ASSERT_EQ(th.columns.size(), 1000U);
    for (const Column& c : th.columns) {
        ASSERT_EQ(c.to - c.from, 2);
        EXPECT_EQ(c.leq, 67.0);
        const Seconds intervalEnd = (c.from / 60 + 1) * 60;
        if (intervalEnd <= h.end) {
            EXPECT_EQ(c.lmax, 80 + static_cast<double>((intervalEnd / 60) % 5));
        }
    }
    EXPECT_EQ(th.x.ticks.front().label, "12:00");
    EXPECT_EQ(th.y.min, 40.0);
    EXPECT_EQ(th.y.max, 90.0);
}

TEST(Spectrum, BandsFromBandFilesOrOctaveLeq) {
    Header h;  // 12:00-13:00, 15-minute blocks
    h.end = at(0, 13);
    const std::vector<std::string> names = {"8Hz", "16Hz", "31.5Hz"};
    SessionFiles s;
    for (std::size_t b = 0; b < names.size(); ++b) {
        std::vector<Row> rows;
        for (int i = 0; i < 4; ++i) {
            Row r{at(0, 12, 15 * (i + 1), 0)};
            r.leq = (i % 2 ? 70.0 : 50.0) + static_cast<double>(b);
            r.l90 = 40 + 2 * i;
            rows.push_back(r);
        }
        s.bands.push_back(fromText(statFile(StatKind::Band, names[b], h, rows)));
        if (b == 0) s.filtered = fromText(statFile(StatKind::Filtered, "LPF", h, rows));
    }
    SessionReport r = analyseSession(s, kThresholds, {});
    ASSERT_TRUE(r.spectrum);
    EXPECT_EQ(r.spectrum->bands, names);
    EXPECT_EQ(r.spectrum->leq, (std::vector<std::optional<double>>{67.0, 68.0, 69.0}));
    EXPECT_EQ(r.spectrum->l90, (std::vector<std::optional<double>>{43.0, 43.0, 43.0}));  // median
    ASSERT_EQ(r.spectrum->columns.size(), 4U);
    EXPECT_EQ(r.spectrum->cells[1 * 3 + 2], 72.0);  // second block, third band
    ASSERT_TRUE(r.filtered);
    EXPECT_EQ(r.filtered->leq, 67.0);
    EXPECT_EQ(r.filtered->lpeak, 80.0);

    // An octave Leq file is finer than the blocks and is used for the band Leq; a filtered
    // channel's level after the bands is not a band.
    Header lh = h;
    lh.leqLength = "60 sec";
    std::vector<LeqLine> rows;
    for (Seconds t = at(0, 12, 1); t <= h.end; t += 60)
        rows.push_back({t, {50, t % 120 ? 50.0 : 70.0, 60, 99}});
    s.octaveLeq.push_back(fromText(leqFile(lh, names, rows)));
    r = analyseSession(s, kThresholds, {});
    EXPECT_EQ(r.spectrum->leq, (std::vector<std::optional<double>>{50.0, 67.0, 60.0}));
    EXPECT_EQ(r.spectrum->columns.size(), 60U);
}

}  // namespace
}  // namespace orv_report
