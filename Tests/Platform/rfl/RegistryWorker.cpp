#include "RegistryWorker.h"

#include <sqlite3.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>

#include "ostcore/utility/StringConversion.h"
#include "RFL/Registry.h"

using namespace RFL;

namespace {

int Increment(RegistryKey& ioKey, long inTimes) {
    for (long done = 0; done < inTimes;) {
        std::uint32_t value = 0;
        const int result = ioKey.IncrementUInt32Value(u"Counter", 1, value);
        if (result == kResultRegistryBusy) {
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
    std::puts("held");
    std::fflush(stdout);
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
    if (task == "increment" && inCount == 2) {
        return Increment(key, std::atol(inArguments[1]));
    }
    if (task == "pairs") {
        return WritePairs(key);
    }
    if (task == "set" && inCount == 3) {
        return key.SetStringValue(ostcore::utility::ToUTF16(inArguments[1]),
                                  ostcore::utility::ToUTF16(inArguments[2]));
    }
    return 2;
}
