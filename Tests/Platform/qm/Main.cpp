// The test program, which is also the other process of its own tests.
#include <gmock/gmock.h>

#include <string_view>

#include "CacheWorker.h"

int main(int inCount, char** inArguments) {
    if (inCount > 1 && std::string_view(inArguments[1]) == kCacheWorkerFlag) {
        return RunCacheWorker(inCount - 2, inArguments + 2);
    }
    testing::InitGoogleMock(&inCount, inArguments);
    return RUN_ALL_TESTS();
}
