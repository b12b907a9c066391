// The library's station and how messages are posted to it.
#pragma once

#include "RFL/Messaging.h"
#include "ZOClient/Types.h"

namespace ZOCL {

/// Registers a new station and makes it the library's. Main thread.
void RegisterStation();

/// Posts a message to the library's station, to be delivered later on the main thread. Threads: any; hold no
/// lock.
template <class T>
void PostLibraryMessage(const T& inMessage);

/// As GetStationID, without the public header.
ImmutableString CurrentStation();

template <class T>
void PostLibraryMessage(const T& inMessage) {
    RFL::StationUtils::PostMessageToUIThread(CurrentStation(), inMessage, false);
}

}  // namespace ZOCL
