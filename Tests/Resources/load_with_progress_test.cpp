// Waiting for the server under a window: what the user sees, and what comes of a cancel.
#include <thread>

#include "ClientTest.h"
#include "ostcore/threads/MainThread.h"
#include "ZOClient/Progress.h"
#include "ZOClient/ResultCodes.h"
#include "ZOClientTesting/ScriptedWindows.h"

namespace ZOCL {
namespace {

using testing::IsEmpty;
using ZOClientTesting::ScriptedWindow;
using ZOClientTesting::ScriptedWindows;

constexpr const char* kWindow = "ZOProgressDialog";

class LoadWithProgressTest : public ClientTest {
protected:
    LoadWithProgressTest() { ostcore::threads::SetMainThread(); }
    ~LoadWithProgressTest() override { ostcore::threads::ResetMainThread(); }

    ScriptedWindows windows;
    const InterfaceRef<IZOCServerResource> resource{Plain("/a")};
};

TEST_F(LoadWithProgressTest, LoadsOnceAndRefreshesOnlyWhenAsked) {
    net->Expect("GET", kHub + std::string("/a"), ScriptedAnswer::JSON("{}").With("ETag", "\"t1\""));
    EXPECT_EQ(LoadServerResourceWithProgress(resource, false), kResultSuccess);
    EXPECT_TRUE(resource->IsLoaded());
    ASSERT_EQ(windows.Shown().size(), 1u);
    EXPECT_EQ(windows.Shown()[0].title, "Waiting");
    EXPECT_EQ(windows.Shown()[0].Text("progressStaticText"),
              "Waiting for data from the Meridane Collaboration Hub.");
    EXPECT_EQ(LoadServerResourceWithProgress(resource, false), kResultSuccess);
    EXPECT_EQ(windows.Shown().size(), 1u);
    net->Expect("GET", kHub + std::string("/a"), ScriptedAnswer::Status(304));
    EXPECT_EQ(LoadServerResourceWithProgress(resource, true), kResultSuccess);
    EXPECT_EQ(LastRequest().Header("If-None-Match"), "\"t1\"");
    EXPECT_TRUE(resource->IsLoaded());
    net->Expect("GET", kHub + std::string("/a"), ScriptedAnswer::Status(404));
    EXPECT_EQ(LoadServerResourceWithProgress(resource, true), kResultHTTPNotFound);
    EXPECT_THAT(net->Mismatches(), IsEmpty());
}

TEST_F(LoadWithProgressTest, ACancelEndsTheRequestAndIsNoFailure) {
    net->SetHandler([](const RecordedRequest&) { return ScriptedAnswer::Hold(); });
    windows.AnswerWith(kWindow, "cancelButton");
    const int result = LoadServerResourceWithProgress(resource, false);
    EXPECT_EQ(result, kResultRequestCancelled);
    EXPECT_TRUE(ResultSucceededOrCanceled(result));
    EXPECT_EQ(net->PendingCount(), 0u);
    EXPECT_FALSE(resource->IsLoaded());
}

TEST_F(LoadWithProgressTest, WithoutAResourceOrOffTheMainThreadNothingIsDone) {
    EXPECT_EQ(LoadServerResourceWithProgress(nullptr, true), kResultFailure);
    std::thread([&] { EXPECT_EQ(LoadServerResourceWithProgress(resource, true), kResultFailure); }).join();
    EXPECT_EQ(net->RequestCount(), 0u);
    EXPECT_THAT(windows.Shown(), IsEmpty());
}

}  // namespace
}  // namespace ZOCL
