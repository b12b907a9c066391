#include "RegistryWorker.h"

#include <sqlite3.h>
#include <sys/resource.h>
#include <unistd.h>

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>

#include "ostcore/utility/StringConversion.h"
#include "RFL/Registry.h"

using namespace RFL;
using ostcore::UString;

namespace {

void Tell(const char* inLine) {
    std::puts(inLine);
    std::fflush(stdout);
}

int Increment(RegistryKey& ioKey, long inTimes) {
    bool wasBusy = false;
    for (long done = 0; done < inTimes;) {
        std::uint32_t value = 0;
        const int result = ioKey.IncrementUInt32Value(u"Counter", 1, value);
        if (result == kResultRegistryBusy) {
            if (!wasBusy) {
                Tell("busy");
            }
            wasBusy = true;
            continue;
        }
        if (result != 0) {
            std::fprintf(stderr, "increment: %s\n", DescribeRegistryResult(result));
            return 1;
        }
        ++done;
    }
    return 0;
}

/// Writes until a write fails for want of room, then makes room and looks whether the store still works.
int FillUp(RegistryKey& ioKey) {
    ::signal(SIGXFSZ, SIG_IGN);
    rlimit limit{};
    ::getrlimit(RLIMIT_FSIZE, &limit);
    const rlimit tight{512 * 1024, limit.rlim_max};
    ::setrlimit(RLIMIT_FSIZE, &tight);
    int result = 0;
    for (std::uint32_t number = 1; result == 0 && number < 1000; ++number) {
        const std::string name = std::to_string(number);
        result =
            ioKey.Apply({RegistryChange::SetString(UString(name.begin(), name.end()), UString(20000, u'x')),
                         RegistryChange::SetUInt32(u"Last", number)});
    }
    if (result != kResultRegistryFailed) {
        return 1;
    }
    ::setrlimit(RLIMIT_FSIZE, &limit);
    return ioKey.SetStringValue(u"After", u"works") == 0 ? 0 : 2;
}

int WritePairs(RegistryKey& ioKey) {
    for (std::uint32_t number = 1;; ++number) {
        const int result =
            ioKey.Apply({RegistryChange::SetUInt32(u"A", number), RegistryChange::SetUInt32(u"B", number)});
        if (result != 0 || std::printf("%u\n", number) < 0 || std::fflush(stdout) != 0) {
            return 1;
        }
    }
}

int Hold() {
    sqlite3* database = nullptr;
    const std::string file = std::string(std::getenv("ZOCLIENT_CONFIG_HOME")) + "/registry.sqlite";
    if (sqlite3_open(file.c_str(), &database) != SQLITE_OK ||
        sqlite3_exec(database, "BEGIN IMMEDIATE; UPDATE sequence SET value=value+1", nullptr, nullptr,
                     nullptr) != SQLITE_OK) {
        return 1;
    }
    Tell("held");
    for (;;) {
        ::pause();
    }
}

}  // namespace

int RunRegistryWorker(int inCount, char** inArguments) {
    const std::string_view task = inCount > 0 ? inArguments[0] : "";
    if (task == "hold") {
        return Hold();
    }
    RegistryKey key;
    if (RegistryKey::Create(RegistryRoot::User, kWorkerKey, key) != 0) {
        return 1;
    }
    if (task == "increment" && inCount == 3) {
        SetRegistryTimeLimit(std::chrono::milliseconds(std::atol(inArguments[2])));
        return Increment(key, std::atol(inArguments[1]));
    }
    if (task == "pairs") {
        return WritePairs(key);
    }
    if (task == "fill") {
        return FillUp(key);
    }
    if (task == "set" && inCount == 3) {
        return key.SetStringValue(ostcore::utility::ToUTF16(inArguments[1]),
                                  ostcore::utility::ToUTF16(inArguments[2]));
    }
    return 2;
}
