#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>

#include "dto/Asset.h"
#include "Sides.h"

namespace {

double PeakBytes() {
    struct rusage usage {};
    return ::getrusage(RUSAGE_SELF, &usage) == 0 ? static_cast<double>(usage.ru_maxrss) * 1024 : -1;
}

double ResidentBytes() {
    long pages = 0;
    long resident = 0;
    std::FILE* file = std::fopen("/proc/self/statm", "r");
    const bool isRead = file && std::fscanf(file, "%ld %ld", &pages, &resident) == 2;
    if (file) {
        std::fclose(file);
    }
    return isRead ? static_cast<double>(resident) * static_cast<double>(::sysconf(_SC_PAGESIZE)) : -1;
}

double PeakOfOneRead(const Body& inBody) {
    const double before = ResidentBytes();
    const ZOCL::dto::ContainedAssets list(ostcore::serialization::JSONParse(inBody));
    const auto assets = list.Assets();
    const double peak = PeakBytes();
    return before < 0 || peak < 0 || assets.size() == 0 ? -1 : peak - before;
}

}  // namespace

double MeasurePeakBytes(const Body& inBody) {
    int ends[2];
    if (::pipe(ends) != 0) {
        return -1;
    }
    const pid_t child = ::fork();
    if (child == 0) {
        const double peak = PeakOfOneRead(inBody);
        ::_exit(::write(ends[1], &peak, sizeof peak) == sizeof peak ? 0 : 1);
    }
    ::close(ends[1]);
    double peak = -1;
    const bool isRead = child > 0 && ::read(ends[0], &peak, sizeof peak) == sizeof peak;
    ::close(ends[0]);
    if (child > 0) {
        ::waitpid(child, nullptr, 0);
    }
    return isRead ? peak : -1;
}
