// What a second process does in the registry tests.
#pragma once

constexpr const char* kRegistryWorkerFlag = "--registry-worker";
constexpr const char16_t* kWorkerKey = u"Software\\Tests\\Worker";

/// increment COUNT LIMIT: adds one to "Counter" so many times, waiting for LIMIT milliseconds and trying
/// again when the store is busy; tells of the first such time by a line. fill: writes until the file may not
/// grow any more, then goes on without that limit. pairs: writes one growing number under "A" and "B" as one
/// transaction for ever, and a line with it after. hold: begins a write, prints a line and goes on holding
/// it. set NAME TEXT: writes one string.
int RunRegistryWorker(int inCount, char** inArguments);
