// Start and end of the library nest.
#include <gtest/gtest.h>

#include "ostcore/logging/SyslogLogger.h"
#include "ostcore/threads/MainThread.h"
#include "ResourceFactory.h"
#include "ZOClient/Library.h"

namespace ZOCL {
namespace {

TEST(Lifecycle, OnlyTheFirstStartAndTheLastEndAct) {
    Initialize();
    const ImmutableString station = GetStationID();
    EXPECT_FALSE(station.IsNull());
    EXPECT_TRUE(ostcore::threads::IsMainThread());
    Initialize();
    EXPECT_EQ(GetStationID(), station);
    EXPECT_TRUE(GetSyslogLogger());
    EXPECT_EQ(GetSyslogLogger(), ostcore::logging::GetStructuredLogger());
    Shutdown();
    EXPECT_TRUE(GetCompositionRoot().resources);
    EXPECT_TRUE(ostcore::logging::GetStructuredLogger());
    Shutdown();
    EXPECT_FALSE(GetCompositionRoot().resources);
    EXPECT_FALSE(ostcore::logging::GetStructuredLogger());
    EXPECT_EQ(GetStationID(), station);
    Initialize();
    EXPECT_NE(GetStationID(), station);
    EXPECT_TRUE(GetCompositionRoot().resources);
    Shutdown();
    // An end without a start is counted, so the next start only makes up for it.
    Shutdown();
    Initialize();
    EXPECT_FALSE(GetCompositionRoot().resources);
}

}  // namespace
}  // namespace ZOCL
