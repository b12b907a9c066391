// Keeps the station's name; it is read on any thread and replaced by the first Initialize of a new start.
#include "Frame/Station.h"

#include "ostcore/threads/Mutex.h"
#include "ZOClient/Library.h"

namespace ZOCL {

namespace {

struct StationName {
    ostcore::threads::Mutex mutex;
    ImmutableString name ZO_GUARDED_BY(mutex);
};

StationName& TheStation() {
    static StationName station;
    return station;
}

}  // namespace

void RegisterStation() {
    const ImmutableString name = RFL::StationRegistry::RegisterUniqueStation();
    StationName& station = TheStation();
    ostcore::threads::MutexLock lock(station.mutex);
    station.name = name;
}

ImmutableString CurrentStation() {
    StationName& station = TheStation();
    ostcore::threads::MutexLock lock(station.mutex);
    return station.name;
}

ImmutableString GetStationID() {
    return CurrentStation();
}

}  // namespace ZOCL
