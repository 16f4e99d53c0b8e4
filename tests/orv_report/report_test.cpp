// The whole report: report.json and the pages from a directory of generated sessions (with a
// bad row, a damaged file and an empty session), every figure on a page found in report.json,
// and the demo session's report rendered by headless Chromium.
#include <gtest/gtest.h>
#include <zlib.h>

#include <cstdint>
#include <cstdlib>
#include <regex>
#include <set>
#include <string>
#include <vector>

#include "generated_results.h"
#include "json_reader.h"
#include "orv_report/report.h"
#include "support/test_support.h"

namespace orv_report {
namespace {

using namespace report_test;
using testing_support::readFile;
using testing_support::TempDir;
using testing_support::writeFile;

// The text a reader sees: no style sheet, no tags.
std::string visibleText(const std::string& html) {
    std::string text;
    const std::size_t styleEnd = html.find("</style>");
    bool inTag = false;
    for (std::size_t i = styleEnd == std::string::npos ? 0 : styleEnd + 8; i < html.size(); ++i) {
        if (html[i] == '<' || html[i] == '>')
            inTag = html[i] == '<', text += ' ';
        else if (!inTag)
            text += html[i];
    }
    return text;
}

// Figures (numbers with a decimal), dates dd/mm/yyyy and clock times hh:mm in a text, each
// with the minus sign before it.
std::vector<std::string> tokens(const std::string& t) {
    static const std::regex token(R"(-?(\d\d/\d\d/\d{4}|\d\d:\d\d|\d+\.\d+))");
    std::vector<std::string> out;
    for (auto it = std::sregex_iterator(t.begin(), t.end(), token); it != std::sregex_iterator();
         ++it)
        out.push_back(it->str());
    return out;
}

void collect(const Json& j, std::set<std::string>& numbers, std::string& strings) {
    if (j.type == Json::Number) numbers.insert(j.raw);
    if (j.type == Json::String) strings += j.str + "\n";
    for (const Json& i : j.items) collect(i, numbers, strings);
    for (const auto& [k, v] : j.members) collect(v, numbers, strings);
}

// Every figure (a number with a decimal), date and clock time on the page is in report.json.
void expectFiguresFromJson(const std::string& page, const Json& json) {
    std::set<std::string> numbers;
    std::string strings;
    collect(json, numbers, strings);
    std::size_t checked = 0;
    for (const std::string& t : tokens(visibleText(page))) {
        ++checked;
        EXPECT_TRUE(numbers.count(t) || strings.find(t) != std::string::npos)
            << t << " is not in report.json";
    }
    EXPECT_GT(checked, 10U);
}

TEST(Report, JsonAndPagesOfSeveralSessions) {
    TempDir dir;
    Header h;  // 12:00-14:00, 15 minutes
    std::vector<Row> rows;
    for (Seconds t = at(0, 12, 15); t <= h.end; t += 900)
        rows.push_back({t, t < at(0, 13, 1) ? 50.0 : 70.0});
    writeFile(dir / "Alpha.csv", statFile(StatKind::General, "", h, rows));
    writeFile(dir / "20240305_12.csv",
              rawFile("Site", "TL40217", at(0, 12), std::vector<double>(36000, 50.4)));
    std::string betaText = statFile(StatKind::General, "", h, rows);
    betaText.replace(betaText.find("\"70.0\""), 6, "\"seventy\"");  // line 26
    writeFile(dir / "Beta/GEN_A_15_F.csv", betaText);
    writeFile(dir / "Gamma.csv", statFile(StatKind::General, "", h, {}));
    writeFile(dir / "Delta.csv", statFile(StatKind::General, "", h, rows).substr(0, 500));

    Options o;
    o.resultsDir = dir.path();
    Report report;
    const Outcome out = writeReport(o, &report);
    ASSERT_TRUE(out.written) << out.error;
    EXPECT_EQ(out.sessions, 3U);
    ASSERT_EQ(out.problems.size(), 2U);
    EXPECT_NE(out.problems[0].find("Delta.csv:"), std::string::npos);
    EXPECT_NE(out.problems[1].find("Beta/GEN_A_15_F.csv:26: row not readable"), std::string::npos);

    const std::string reportDir = dir / "report";
    const Json json = parseJson(readFile(reportDir + "/report.json"));
    const Json& sessions = json["sessions"];
    ASSERT_EQ(sessions.items.size(), 3U);
    // Sessions of the flat layout come first.
    const Json &alpha = sessions[0], &gamma = sessions[1], &beta = sessions[2];
    EXPECT_EQ(alpha["name"].str, "Alpha");
    EXPECT_EQ(alpha["Leq"]["level"].raw, "67.0");  // 4 x 50 dB and 4 x 70 dB in power
    EXPECT_EQ(alpha["Leq"]["coverage"].raw, "100.0");
    EXPECT_EQ(alpha["hours"][0]["Leq"]["level"].raw, "50.0");
    EXPECT_EQ(alpha["days"][0]["Lday"]["coverage"].raw, "16.7");
    EXPECT_TRUE(alpha["days"][0]["Lday"]["flagged"].b);
    EXPECT_EQ(alpha["quality"]["audio_hours"][0]["difference"].raw, "0.4");
    EXPECT_EQ(beta["layout"].str, "sub-directory (-bin)");
    EXPECT_EQ(beta["problems"].items.size(), 1U);
    EXPECT_EQ(beta["quality"]["gaps"]["count"].raw, "1");  // the unreadable row's interval
    EXPECT_EQ(gamma["name"].str, "Gamma");
    EXPECT_TRUE(gamma["empty"].b);
    EXPECT_TRUE(gamma["Lden"]["level"].isNull());

    const std::string index = readFile(reportDir + "/index.html");
    for (const char* page : {"Alpha.html", "Beta.html", "Gamma.html"})
        EXPECT_NE(index.find(std::string("href=\"") + page), std::string::npos) << page;
    EXPECT_NE(readFile(reportDir + "/Gamma.html").find("hold no rows"), std::string::npos);
    for (const char* page : {"index.html", "Alpha.html", "Beta.html"}) {
        SCOPED_TRACE(page);
        const std::string html = readFile(reportDir + "/" + page);
        EXPECT_EQ(html.find("<script"), std::string::npos);
        EXPECT_EQ(html.find("http"), std::string::npos);  // nothing from the network
        expectFiguresFromJson(html, json);
    }
}

// Width, height and RGB pixels of an 8-bit RGB or RGBA PNG.
struct Image {
    std::uint32_t width = 0, height = 0;
    std::vector<std::uint8_t> rgb;
};

std::uint32_t be32(const std::string& s, std::size_t at) {
    return static_cast<std::uint32_t>(static_cast<std::uint8_t>(s[at])) << 24 |
           static_cast<std::uint32_t>(static_cast<std::uint8_t>(s[at + 1])) << 16 |
           static_cast<std::uint32_t>(static_cast<std::uint8_t>(s[at + 2])) << 8 |
           static_cast<std::uint8_t>(s[at + 3]);
}

Image decodePng(const std::string& png) {
    Image img;
    std::string idat;
    unsigned channels = 0;
    for (std::size_t at = 8; at + 8 <= png.size();) {
        const std::uint32_t len = be32(png, at);
        const std::string type = png.substr(at + 4, 4);
        if (type == "IHDR") {
            img.width = be32(png, at + 8), img.height = be32(png, at + 12);
            EXPECT_EQ(png[at + 16], 8);  // bit depth
            channels = png[at + 17] == 6 ? 4 : png[at + 17] == 2 ? 3 : 0;
        }
        if (type == "IDAT") idat += png.substr(at + 8, len);
        at += 12 + len;
    }
    if (!channels) return {};
    const std::size_t stride = img.width * channels;
    std::vector<std::uint8_t> raw((stride + 1) * img.height);
    uLongf size = raw.size();
    if (uncompress(raw.data(), &size, reinterpret_cast<const Bytef*>(idat.data()), idat.size()) !=
        Z_OK)
        return {};
    std::vector<std::uint8_t> cur(stride), prev(stride, 0);
    for (std::uint32_t y = 0; y < img.height; ++y) {
        const std::uint8_t filter = raw[y * (stride + 1)];
        const std::uint8_t* line = &raw[y * (stride + 1) + 1];
        for (std::size_t x = 0; x < stride; ++x) {
            const int a = x >= channels ? cur[x - channels] : 0, b = prev[x],
                      c = x >= channels ? prev[x - channels] : 0;
            // Filters 1-4: sub, up, average, Paeth.
            const int pa = std::abs(b - c), pb = std::abs(a - c), pc = std::abs(a + b - 2 * c);
            const int paeth = pa <= pb && pa <= pc ? a : pb <= pc ? b : c;
            const int p = filter == 1   ? a
                          : filter == 2 ? b
                          : filter == 3 ? (a + b) / 2
                          : filter == 4 ? paeth
                                        : 0;
            cur[x] = static_cast<std::uint8_t>(line[x] + p);
        }
        for (std::size_t x = 0; x < stride; x += channels)
            img.rgb.insert(img.rgb.end(), &cur[x], &cur[x] + 3);
        prev.swap(cur);
    }
    return img;
}

TEST(Report, DemoRendersInHeadlessChromium) {
    const char* chromium = "/usr/bin/chromium";
    if (!testing_support::exists(chromium)) GTEST_SKIP() << "Debian chromium is not installed";
    TempDir dir;
    const std::string log = dir / "log.txt";
    const auto run = [&](const std::string& command) {
        ASSERT_EQ(std::system((command + " >>" + log + " 2>&1").c_str()), 0) << command << "\n"
                                                                             << readFile(log);
    };
    run("cd " + dir.path() + " && " ORV_DEMO_PATH " --out demo-session");
    run(std::string(ORV_CMD_PATH) + " -s " + (dir / "demo-session") + " -d " + (dir / "results") +
        " -leq 1 -i 1 -oct 3 Z F -bpf 500 2000 A F -csv");
    run(std::string(ORV_REPORT_PATH) + " " + (dir / "results"));
    const std::string page = dir / "results/report/Demo.html";
    ASSERT_NE(readFile(log).find("Report: " + (dir / "results/report") + "/index.html"),
              std::string::npos);
    const std::string html = readFile(page);
    EXPECT_LT(html.size(), 3U << 20);
    // Where orv_cmd writes the audio results, the spectrum and the audio check show them.
    if (testing_support::exists(dir / "results/Demo_LEQ3OCT.csv")) {
        EXPECT_NE(html.find("Band Leq over time"), std::string::npos);
        EXPECT_NE(html.find("2 hour(s) compared"), std::string::npos);
    }

    const std::string png = dir / "demo.png";
    run(std::string(chromium) +
        " --headless --no-sandbox --disable-gpu --disable-quic --no-first-run "
        "--disable-background-networking --disable-component-update --disable-sync "
        "--hide-scrollbars "
        "--user-data-dir=" +
        (dir / "profile") + " --window-size=1000,1400 --screenshot=" + png + " file://" + page);
    const Image img = decodePng(readFile(png));
    ASSERT_EQ(img.width, 1000U);
    ASSERT_EQ(img.height, 1400U);
    std::size_t ink = 0, blue = 0, red = 0;
    for (std::size_t i = 0; i + 2 < img.rgb.size(); i += 3) {
        const int r = img.rgb[i], g = img.rgb[i + 1], b = img.rgb[i + 2];
        ink += r + g + b < 600;
        blue += b > r + 60 && b > g + 20;  // the Leq line
        red += r > g + 80 && r > b + 80;   // the Lmax line
    }
    EXPECT_GT(ink, img.rgb.size() / 3 / 50) << "the page looks blank";
    EXPECT_GT(blue, 500U);
    EXPECT_GT(red, 500U);
}

}  // namespace
}  // namespace orv_report
