#include "CacheWorker.h"

#include <cstdio>
#include <cstdlib>

#include "CacheFixture.h"

int RunCacheWorker(int inCount, char** inArguments) {
    if (inCount != 5) {
        return 2;
    }
    QM::shared_ptr<QM::DiskCacheManager::ManagedDirectory> manager;
    const auto cache = QM::CreateDataCacheInFilesystemAndManageDirectory(inArguments[0], manager, true);
    if (!cache) {
        return 1;
    }
    manager->SetMaxFileCount(std::strtoul(inArguments[1], nullptr, 10));
    const int first = std::atoi(inArguments[2]);
    const int count = std::atoi(inArguments[3]);
    const int step = std::atoi(inArguments[4]);
    // Eight at a time, so that files are written without a break.
    for (int number = first; count == 0 || number < first + count; number += 8) {
        const int end = count == 0 ? number + 8 : std::min(number + 8, first + count);
        for (int each = number; each < end; ++each) {
            cache->Write(KeyOf(each * step), QM::ImmutableString("gz"), PayloadOf(each * step));
        }
        if (!cache->WaitForWrites(60000) || std::printf("%d\n", end - 1) < 0 || std::fflush(stdout) != 0) {
            return 1;
        }
    }
    cache->Close(60000);
    return 0;
}
