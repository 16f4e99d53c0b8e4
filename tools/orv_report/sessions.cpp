#include "sessions.h"

#include <algorithm>
#include <cctype>
#include <map>
#include <set>
#include <span>
#include <tuple>

#include "platform/directory.h"

namespace orv_report {
namespace {

bool isLeqKind(FileKind k) { return k == FileKind::Leq || k == FileKind::OctaveLeq; }

bool endsWith(std::string_view s, std::string_view tail) {
    return s.size() >= tail.size() && s.substr(s.size() - tail.size()) == tail;
}

// "LEQ_A_1_F_2" -> ("LEQ_A_1_F", 2): a roll-over part number follows a letter and '_'.
std::pair<std::string, unsigned> splitPart(const std::string& stem) {
    const std::size_t us = stem.rfind('_');
    if (us == std::string::npos || us == 0 || us + 1 == stem.size() ||
        !std::isalpha(static_cast<unsigned char>(stem[us - 1])) ||
        !std::all_of(stem.begin() + static_cast<long>(us) + 1, stem.end(),
                     [](char c) { return std::isdigit(static_cast<unsigned char>(c)); }))
        return {stem, 0};
    return {stem.substr(0, us), static_cast<unsigned>(std::stoul(stem.substr(us + 1)))};
}

// A classified file with where it belongs.
struct Placed {
    ResultFile file;
    std::string session;  // session name
    std::string group;    // files of one setting: the Leq parts of one file, one band set
    unsigned part = 0;
};

// In the flat layout the session is the file name without the suffix of its kind.
std::optional<std::string> flatSessionName(const ResultFile& f, const std::string& base) {
    switch (f.kind) {
        case FileKind::General:
            return base;
        case FileKind::Leq:
            if (endsWith(base, "_LEQ")) return base.substr(0, base.size() - 4);
            break;
        case FileKind::OctaveLeq:
            if (const std::size_t at = base.rfind("_LEQ"); at != std::string::npos && at > 0)
                return base.substr(0, at);
            break;
        case FileKind::Band:
        case FileKind::Filtered:
            if (endsWith(base, "_" + f.label) && base.size() > f.label.size() + 1)
                return base.substr(0, base.size() - f.label.size() - 1);
            break;
        default:
            break;
    }
    return std::nullopt;
}

std::string safeId(const std::string& name) {
    std::string id;
    for (char c : name)
        id += std::isalnum(static_cast<unsigned char>(c)) || c == '-' || c == '.' || c == '_' ? c
                                                                                              : '_';
    if (id.empty() || id == "index" || id == "report" || id.front() == '.') id = "session_" + id;
    return id;
}

// Of several files of one kind (a -bin directory written with other settings), the one
// shown: A weighting first, then the finest interval, then the name.
template <typename Key>
const std::string* chooseGroup(const std::map<std::string, std::vector<Placed*>>& groups, Key key) {
    const std::string* best = nullptr;
    for (const auto& [name, files] : groups)
        if (!best || key(files) < key(groups.at(*best))) best = &name;
    return best;
}

void assemble(SessionFiles& s, std::vector<Placed*>& files) {
    std::map<FileKind, std::map<std::string, std::vector<Placed*>>> groups;
    for (Placed* p : files) groups[p->file.kind][p->group].push_back(p);
    std::set<const Placed*> used;
    const auto weightingRank = [](const ResultFile& f) {
        return f.header.frequencyWeighting == "A" ? 0 : 1;
    };
    const auto take = [&](FileKind kind, auto key) -> std::vector<Placed*> {
        auto& g = groups[kind];
        const std::string* chosen = chooseGroup(g, key);
        if (!chosen) return {};
        std::vector<Placed*> v = g[*chosen];
        std::sort(v.begin(), v.end(), [](const Placed* a, const Placed* b) {
            return std::tie(a->part, a->file.path) < std::tie(b->part, b->file.path);
        });
        used.insert(v.begin(), v.end());
        return v;
    };
    auto general = take(FileKind::General, [&](const std::vector<Placed*>& v) {
        return std::tuple(weightingRank(v[0]->file), v[0]->file.header.statsMinutes);
    });
    if (!general.empty()) s.general = std::move(general[0]->file);
    const std::string generalWeighting = s.general ? s.general->header.frequencyWeighting : "A";
    for (Placed* p : take(FileKind::Leq, [&](const std::vector<Placed*>& v) {
             return std::tuple(v[0]->file.header.frequencyWeighting != generalWeighting,
                               v[0]->file.header.leqSeconds);
         }))
        s.leq.push_back(std::move(p->file));
    for (Placed* p : take(FileKind::OctaveLeq, [](const std::vector<Placed*>& v) {
             return v[0]->file.header.leqSeconds;
         }))
        s.octaveLeq.push_back(std::move(p->file));
    for (Placed* p : take(FileKind::Band, [](const std::vector<Placed*>& v) {
             return std::tuple(-static_cast<long>(v.size()), v[0]->file.header.statsMinutes);
         }))
        s.bands.push_back(std::move(p->file));
    std::stable_sort(s.bands.begin(), s.bands.end(), [](const ResultFile& a, const ResultFile& b) {
        return bandFrequency(a.label).value_or(0) < bandFrequency(b.label).value_or(0);
    });
    auto filtered = take(FileKind::Filtered, [](const std::vector<Placed*>& v) {
        return v[0]->file.header.statsMinutes;
    });
    if (!filtered.empty()) s.filtered = std::move(filtered[0]->file);
    for (Placed* p : files)
        if (!used.count(p)) s.unused.push_back(p->file.path);
}

// Seconds of [a0, a1) inside [b0, b1).
Seconds overlap(Seconds a0, Seconds a1, Seconds b0, Seconds b1) {
    return std::max<Seconds>(0, std::min(a1, b1) - std::max(a0, b0));
}

// The session an hourly level file of the flat layout belongs to: same title and serial,
// and of the sessions covering its hour the one whose share of the hour is nearest to the
// file's length (two sessions in one hour each get a file, "_1" for the second).
SessionFiles* ownerOf(const ResultFile& raw, std::span<SessionFiles> sessions) {
    SessionFiles* best = nullptr;
    Seconds bestMiss = 0;
    for (SessionFiles& s : sessions) {
        const ResultHeader* h = s.header();
        if (!h || !h->start || !h->end || h->title != raw.raw.title ||
            raw.raw.serial.compare(0, h->serial.size(), h->serial) != 0)
            continue;
        const Seconds o = overlap(raw.raw.hourStart, raw.raw.hourStart + 3600, *h->start, *h->end);
        if (o == 0) continue;
        const Seconds miss = std::abs(o - static_cast<Seconds>(raw.raw.records / 10));
        if (!best || miss < bestMiss) best = &s, bestMiss = miss;
    }
    return best;
}

// Classifies the *.csv files of one directory.
std::vector<Placed> placeFiles(const std::string& dir, bool binLayout, const std::string& binName,
                               std::vector<Problem>& problems) {
    std::vector<platform::DirEntry> entries;
    std::vector<Placed> out;
    if (!platform::listDirectory(dir, "*.csv", entries)) return out;
    for (const platform::DirEntry& e : entries) {
        if (e.isDirectory) continue;
        auto f = classifyPath(platform::joinPath(dir, e.name), problems);
        if (!f || f->kind == FileKind::Unknown) continue;
        const std::string stem = e.name.substr(0, e.name.size() - 4);
        Placed p{std::move(*f), binName, stem, 0};
        std::string base = stem;
        if (isLeqKind(p.file.kind)) std::tie(base, p.part) = splitPart(stem);
        if (p.file.kind == FileKind::RawLevels) {
            p.session = binLayout ? binName : std::string();
        } else if (!binLayout) {
            const auto name = flatSessionName(p.file, base);
            if (!name) {
                problems.push_back(
                    {p.file.path, 0, "the name does not say which session it belongs to; skipped"});
                continue;
            }
            p.session = *name;
            p.group = std::to_string(static_cast<int>(p.file.kind));
        } else {
            p.group = base;
            if (p.file.kind == FileKind::Band)
                if (const std::size_t at = base.find(p.file.label); at != std::string::npos)
                    p.group.erase(at, p.file.label.size());
        }
        out.push_back(std::move(p));
    }
    return out;
}

}  // namespace

const ResultHeader* SessionFiles::header() const {
    if (general) return &general->header;
    for (const auto* v : {&leq, &octaveLeq, &bands})
        if (!v->empty()) return &v->front().header;
    if (filtered) return &filtered->header;
    return nullptr;
}

Catalogue findSessions(const std::string& resultsDir, const std::string& skipDir,
                       std::vector<Problem>& problems) {
    Catalogue cat;
    std::vector<Placed> flat = placeFiles(resultsDir, false, "", problems);
    std::vector<std::pair<std::string, std::vector<Placed>>> binDirs;
    std::vector<platform::DirEntry> entries;
    std::string skip;
    platform::canonicalDirectory(skipDir, skip);
    if (platform::listDirectory(resultsDir, "*", entries))
        for (const platform::DirEntry& e : entries) {
            const std::string dir = platform::joinPath(resultsDir, e.name);
            std::string canonical;
            if (!e.isDirectory ||
                (platform::canonicalDirectory(dir, canonical) && canonical == skip))
                continue;
            std::vector<Placed> files = placeFiles(dir, true, e.name, problems);
            if (!files.empty()) binDirs.emplace_back(e.name, std::move(files));
        }

    std::set<std::string> ids;
    const auto addSession = [&](const std::string& name, bool bin, std::vector<Placed*>& files) {
        SessionFiles s;
        s.name = name;
        s.binLayout = bin;
        s.id = safeId(name);
        for (int n = 2; ids.count(s.id); ++n) s.id = safeId(name) + "-" + std::to_string(n);
        ids.insert(s.id);
        std::vector<Placed*> results, raws;
        for (Placed* p : files) (p->file.kind == FileKind::RawLevels ? raws : results).push_back(p);
        assemble(s, results);
        for (Placed* p : raws) s.raw.push_back(std::move(p->file));
        if (s.header() || !s.raw.empty()) cat.sessions.push_back(std::move(s));
    };

    std::map<std::string, std::vector<Placed*>> flatSessions;
    std::vector<Placed*> flatRaw;
    for (Placed& p : flat)
        (p.file.kind == FileKind::RawLevels ? flatRaw : flatSessions[p.session]).push_back(&p);
    for (auto& [name, files] : flatSessions) addSession(name, false, files);
    const std::size_t flatCount = cat.sessions.size();
    for (auto& [name, files] : binDirs) {
        std::vector<Placed*> v;
        for (Placed& p : files) v.push_back(&p);
        addSession(name, true, v);
    }
    // Hourly level files of the flat layout go to the session of their title and hour.
    for (Placed* p : flatRaw) {
        if (SessionFiles* owner = ownerOf(p->file, {cat.sessions.data(), flatCount}))
            owner->raw.push_back(std::move(p->file));
        else
            cat.unusedFiles.push_back(p->file.path);
    }
    for (SessionFiles& s : cat.sessions)
        std::sort(s.raw.begin(), s.raw.end(), [](const ResultFile& a, const ResultFile& b) {
            return std::tie(a.raw.hourStart, a.path) < std::tie(b.raw.hourStart, b.path);
        });
    return cat;
}

void readSessionRows(SessionFiles& s, std::vector<Problem>& problems) {
    if (s.general) readRowsFromDisk(*s.general, problems);
    if (s.filtered) readRowsFromDisk(*s.filtered, problems);
    for (ResultFile& b : s.bands) readRowsFromDisk(b, problems);
    for (ResultFile& r : s.raw) readRowsFromDisk(r, problems);
    // Roll-over parts continue the rows of the first part.
    for (auto* parts : {&s.leq, &s.octaveLeq}) {
        if (parts->empty()) continue;
        ResultFile& first = parts->front();
        const std::string firstPath = first.path;
        for (const ResultFile& part : *parts) {
            first.path = part.path;
            readRowsFromDisk(first, problems);
        }
        first.path = firstPath;
    }
}

}  // namespace orv_report
