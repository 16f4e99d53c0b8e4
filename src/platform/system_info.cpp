#include "platform/system_info.h"

#include <unistd.h>

#include <cstdio>
#include <fstream>
#include <set>
#include <string>
#include <thread>
#include <utility>

#include "kernels.h"

namespace platform {

int vectorKernelStartup() {
    // The level library's own choice (AVX2 with FMA, and a build that has those kernels),
    // so that the status names the code path that actually runs.
    return SlmLibrary::avx2Kernels() != nullptr ? 0 : kGenericCodePathStatus;
}

unsigned logicalProcessorCount() {
    const long n = ::sysconf(_SC_NPROCESSORS_ONLN);
    if (n > 0) return static_cast<unsigned>(n);
    const unsigned h = std::thread::hardware_concurrency();
    return h > 0 ? h : 1;
}

unsigned physicalCoreCount() {
    // Distinct (physical id, core id) pairs of /proc/cpuinfo.
    std::ifstream in("/proc/cpuinfo");
    std::set<std::pair<std::string, std::string>> cores;
    std::string line;
    std::string physical = "0";
    while (std::getline(in, line)) {
        const auto colon = line.find(':');
        if (colon == std::string::npos) continue;
        const std::string key = line.substr(0, line.find_last_not_of(" \t", colon - 1) + 1);
        const std::string value = colon + 2 <= line.size() ? line.substr(colon + 2) : "";
        if (key == "physical id") physical = value;
        if (key == "core id") cores.emplace(physical, value);
    }
    return cores.empty() ? logicalProcessorCount() : static_cast<unsigned>(cores.size());
}

std::uint64_t residentBytes() {
    std::FILE* f = std::fopen("/proc/self/statm", "re");
    if (f == nullptr) return 0;
    unsigned long long size = 0;
    unsigned long long resident = 0;
    const int n = std::fscanf(f, "%llu %llu", &size, &resident);
    std::fclose(f);
    if (n != 2) return 0;
    return resident * static_cast<std::uint64_t>(::sysconf(_SC_PAGESIZE));
}

}  // namespace platform
