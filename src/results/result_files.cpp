#include "results/result_files.h"

#include <cerrno>

#include "fweight.h"
#include "octave_filter.h"
#include "platform/directory.h"
#include "platform/error_text.h"
#include "platform/path.h"
#include "results/result_header.h"
#include "results/text_buffer.h"
#include "tweight.h"

namespace orv {

const char* filterName(std::uint32_t type) {
    static constexpr const char* kNames[] = {"ERR", "LPF", "HPF", "BPF", "BSF", "IIR", "APF"};
    return type < std::size(kNames) ? kNames[type] : kNames[0];
}

const char* octaveLabel(std::uint32_t bandCount) { return bandCount == 36 ? "3OCT" : "1OCT"; }

namespace {

const char* bandName(std::uint32_t band, std::uint32_t bandCount) {
    return bandCount == 36 ? SlmLibrary::OctaveFilter::getThirdName(band)
                           : SlmLibrary::OctaveFilter::getFullName(band);
}

// The name with every character that could lead a path out of its directory, or make it
// hidden, replaced by '_'.
std::string usableFileName(std::string name) {
    for (char& c : name) {
        const auto u = static_cast<unsigned char>(c);
        if (c == '/' || c == '\\' || u < 0x20 || u == 0x7F) c = '_';
    }
    if (!name.empty() && name[0] == '.') name[0] = '_';
    return name;
}

}  // namespace

std::string RunResults::sessionFileName(const SessionRecord& session) {
    std::string name = usableFileName(session.sessionName);
    if (name.empty()) {
        // The session directory's own name: the last part of its path.
        std::string dir = session.sessionPath;
        while (!dir.empty() && dir.back() == platform::kPathSeparator) dir.pop_back();
        name = usableFileName(dir.substr(dir.find_last_of(platform::kPathSeparator) + 1));
        if (name.empty()) name.assign(1, '_');
    }
    if (name != session.sessionName) {
        out.print("ERR: Session name of %s cannot be used as a file name - using \"%s\"\r\n",
                  session.sessionPath.c_str(), name.c_str());
    }
    if (taken_.contains(name)) {
        std::string numbered;
        for (unsigned n = 2; numbered.empty() || taken_.contains(numbered); ++n) {
            numbered.assign(name).append(1, '_').append(std::to_string(n));
        }
        out.print(
            "ERR: Session name \"%s\" already used in this run - results of %s named "
            "\"%s\"\r\n",
            name.c_str(), session.sessionPath.c_str(), numbered.c_str());
        name = std::move(numbered);
    }
    taken_.insert(name);
    return name;
}

bool ResultFile::create(const std::string& path, RunResults& run) {
    close();
    run_ = &run;
    path_ = path;
    reported_ = false;
    int error = 0;
    if (path.size() > ResultNaming::kMaxPathLength) {
        error = ENAMETOOLONG;
    } else {
        file_ = platform::createResultFile(path, &error);
    }
    if (file_.valid()) return true;
    run.out.print("Unable to open %s : %u\r\n", path.c_str(), static_cast<unsigned>(error));
    run.markLost();
    return false;
}

ResultFile& ResultFile::operator=(ResultFile&& other) {
    if (this != &other) {
        close();  // reports a failed close of the file it held
        file_ = std::move(other.file_);
        path_ = std::move(other.path_);
        run_ = other.run_;
        reported_ = other.reported_;
    }
    return *this;
}

bool ResultFile::write(std::string_view text) {
    if (!file_.valid()) return false;
    int error = 0;
    if (file_.write(text.data(), text.size(), &error) == text.size()) return true;
    reportWriteFailure(error);
    return false;
}

void ResultFile::close() {
    if (!file_.valid()) return;
    const int error = file_.close();
    if (error != 0) reportWriteFailure(error);
}

void ResultFile::reportWriteFailure(int error) {
    run_->markLost();
    if (reported_) return;
    reported_ = true;
    run_->out.print("ERR: Unable to write %s : %s\r\n", path_.c_str(),
                    platform::errorText(error).c_str());
}

std::string ResultNaming::directory() const {
    if (settings_.binMode == 0) return settings_.outputDir;
    return settings_.outputDir + name_ + platform::kPathSeparator;
}

std::string ResultNaming::prepareSessionDirectory() const {
    if (settings_.binMode == 0) return {};
    const std::string dir = directory();
    platform::makeDirectory(dir);
    return dir;
}

std::string ResultNaming::general() const {
    TextBuffer b;
    if (settings_.binMode == 0) {
        b.append("%s%s.csv", settings_.outputDir.c_str(), name_.c_str());
    } else {
        b.append("%sGEN_%s_%u_%s.csv", directory().c_str(),
                 SlmLibrary::FWeight::shortName(settings_.generalWeighting),
                 displayInterval(settings_.statsIntervalMin),
                 SlmLibrary::TWeight::shortName(generalTimeWeighting_));
    }
    return b.str();
}

std::string ResultNaming::leq(LeqFileKind kind, std::uint32_t octaveBandCount) const {
    const char* suffix = kind == LeqFileKind::AllPass ? "" : octaveLabel(octaveBandCount);
    TextBuffer b;
    if (settings_.binMode == 0) {
        b.append("%s%s_LEQ%s.csv", settings_.outputDir.c_str(), name_.c_str(), suffix);
    } else if (kind == LeqFileKind::AllPass) {
        b.append("%sLEQ%s_%s_%u_%s.csv", directory().c_str(), suffix,
                 SlmLibrary::FWeight::shortName(settings_.generalWeighting),
                 displayInterval(settings_.leqInterval),
                 SlmLibrary::TWeight::shortName(generalTimeWeighting_));
    } else {
        b.append("%sLEQ%s_%s_%u_%s.csv", directory().c_str(), suffix,
                 SlmLibrary::FWeight::shortName(settings_.octaveFreqWeighting),
                 displayInterval(settings_.leqInterval),
                 SlmLibrary::TWeight::shortName(settings_.octaveTimeWeighting));
    }
    return b.str();
}

std::string ResultNaming::octaveBand(std::uint32_t band, std::uint32_t bandCount) const {
    TextBuffer b;
    if (settings_.binMode == 0) {
        b.append("%s%s_%s.csv", settings_.outputDir.c_str(), name_.c_str(),
                 bandName(band, bandCount));
    } else {
        b.append("%s%s%s_%s_%u_%s.csv", directory().c_str(), octaveLabel(bandCount),
                 bandName(band, bandCount),
                 SlmLibrary::FWeight::shortName(settings_.octaveFreqWeighting),
                 displayInterval(settings_.statsIntervalMin),
                 SlmLibrary::TWeight::shortName(settings_.octaveTimeWeighting));
    }
    return b.str();
}

std::string ResultNaming::filtered() const {
    TextBuffer b;
    if (settings_.binMode == 0) {
        b.append("%s%s_%s.csv", settings_.outputDir.c_str(), name_.c_str(),
                 filterName(settings_.auxFilterType));
    } else {
        b.append("%s%s-%u-%u_%s_%u_%s.csv", directory().c_str(),
                 filterName(settings_.auxFilterType), static_cast<unsigned>(settings_.auxFreq1),
                 static_cast<unsigned>(settings_.auxFreq2),
                 SlmLibrary::FWeight::shortName(settings_.auxFreqWeighting),
                 displayInterval(settings_.statsIntervalMin),
                 SlmLibrary::TWeight::shortName(settings_.auxTimeWeighting));
    }
    return b.str();
}

std::string ResultNaming::leqPart(const std::string& name, std::uint32_t part) {
    const std::string base = name.size() >= 4 ? name.substr(0, name.size() - 4) : name;
    TextBuffer b;
    b.append("%s_%u.csv", base.c_str(), part);
    return b.str();
}

}  // namespace orv
