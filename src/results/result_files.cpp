#include "results/result_files.h"

#include <cerrno>

#include "fweight.h"
#include "octave_filter.h"
#include "platform/directory.h"
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

}  // namespace

std::string ResultNaming::directory() const {
    if (settings_.binMode == 0) return settings_.outputDir;
    return settings_.outputDir + session_.sessionName + platform::kPathSeparator;
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
        b.append("%s%s.csv", settings_.outputDir.c_str(), session_.sessionName.c_str());
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
        b.append("%s%s_LEQ%s.csv", settings_.outputDir.c_str(), session_.sessionName.c_str(),
                 suffix);
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
        b.append("%s%s_%s.csv", settings_.outputDir.c_str(), session_.sessionName.c_str(),
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
        b.append("%s%s_%s.csv", settings_.outputDir.c_str(), session_.sessionName.c_str(),
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

platform::File createResultFile(const std::string& path, platform::Console& out) {
    int error = 0;
    platform::File file;
    if (path.size() > ResultNaming::kMaxPathLength) {
        error = ENAMETOOLONG;
    } else {
        file = platform::createResultFile(path, &error);
    }
    if (!file.valid())
        out.print("Unable to open %s : %u\r\n", path.c_str(), static_cast<unsigned>(error));
    return file;
}

}  // namespace orv
