// The phases of bulk transactions: their order, their failures, and every way in which one ends early.
#include "BulkTest.h"
#include "ostcore/debug/DebugDatabase.h"

namespace ZOCL {
namespace {

using testing::Each;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

class BulkPhasesTest : public BulkTest {
protected:
    /// One of each kind.
    struct Work {
        Calls created;
        Calls deleted;
        Calls edited;
    };
    Work Gather(const InterfaceRef<IZOCBulkTransaction>& inBulk) {
        Work work;
        EXPECT_TRUE(inBulk->SetAssetEnclosure(work.edited.Result(), "A1", "notes", Bytes("n")));
        EXPECT_TRUE(inBulk->DeleteAsset(work.deleted.Result(), "A2"));
        EXPECT_TRUE(Add(inBulk, work.created.Asset(), u"N"));
        return work;
    }
    /// A run in which the creation is answered so; the answer is the creation's result.
    int CreateWith(const ScriptedAnswer& inAnswer, int inExpectedEnd) {
        On("POST /t1/bulk/create", inAnswer);
        BulkRun run(MakeTransaction());
        Calls calls;
        EXPECT_TRUE(Add(run.bulk, calls.Asset(), u"N", "e", "x"));
        EXPECT_EQ(run.Finish(), inExpectedEnd);
        EXPECT_THAT(calls.Results(), SizeIs(1));
        EXPECT_FALSE(calls.Assets().at(0));
        return calls.Results().at(0);
    }
};

TEST_F(BulkPhasesTest, TheOrderIsFixedWhateverTheOrderOfTheFinishCalls) {
    const std::vector<std::function<void(const InterfaceRef<IZOCBulkTransaction>&)>> orders{
        [](const auto& inBulk) { inBulk->FinishedEditing(); },
        [](const auto& inBulk) {
            inBulk->FinishedDeletingAssets();
            inBulk->FinishedCreatingNewAssets();
            inBulk->FinishedCreatingNewAssets();
            inBulk->FinishedEditing();
        }};
    for (const auto& finish : orders) {
        net->ClearRequests();
        BulkRun run(MakeTransaction());
        const Work work = Gather(run.bulk);
        finish(run.bulk);
        EXPECT_EQ(run.Wait(), kResultSuccess);
        EXPECT_THAT(Writes(),
                    ElementsAre("POST /t1/bulk/create", "POST /t1/bulk/delete", "PUT /t1/bulk/edit"));
        for (const Calls& calls : {work.created, work.deleted, work.edited}) {
            EXPECT_THAT(calls.Results(), ElementsAre(kResultSuccess));
        }
        EXPECT_TRUE(run.bulk->IsCompletelyFinished());
        EXPECT_FALSE(run.bulk->GetCreateOperation() || run.bulk->GetEditOperation());
        EXPECT_FALSE(Add(run.bulk, work.created.Asset(), u"late"));
        EXPECT_FALSE(run.bulk->DeleteAsset(work.deleted.Result(), "A1"));
        EXPECT_FALSE(run.bulk->SetAssetEnclosure(work.edited.Result(), "A1", "notes", Bytes("n")));
    }
}

TEST_F(BulkPhasesTest, APhaseWaitsForTheAnswersOfTheOneBefore) {
    On("POST /t1/bulk/create", ScriptedAnswer::Hold());
    BulkRun run(MakeTransaction());
    const Work work = Gather(run.bulk);
    run.bulk->FinishedEditing();
    ASSERT_TRUE(net->WaitForRequests(2));
    net->WaitUntilIdle();
    EXPECT_THAT(Writes(), ElementsAre("POST /t1/bulk/create"));
    EXPECT_FALSE(run.bulk->IsCompletelyFinished());
    net->ReleaseHeld(Answer(LastRequest()));
    EXPECT_EQ(run.Wait(), kResultSuccess);
    EXPECT_THAT(Writes(), SizeIs(3));
}

TEST_F(BulkPhasesTest, NothingToDoSendsNothing) {
    BulkRun run(MakeTransaction());
    EXPECT_EQ(run.Finish(), kResultSuccess);
    EXPECT_THAT(Writes(), IsEmpty());
}

TEST_F(BulkPhasesTest, AFailureEndsTheWorkAndIsToldToThoseWhoWereSent) {
    const char* const lines[] = {"POST /t1/bulk/create", "POST /t1/bulk/delete", "PUT /t1/bulk/edit"};
    for (std::size_t failing = 0; failing < 3; ++failing) {
        net->ClearRequests();
        On("POST /t1/bulk/create", [](const RecordedRequest& inRequest) { return Answer(inRequest); });
        On("POST /t1/bulk/delete", JSONAnswer("{}"));
        On(lines[failing], failing == 1 ? ScriptedAnswer::FailStart() : ScriptedAnswer::Status(409));
        const int expected = failing == 1 ? kResultNotStarted : kResultHTTPConflict;
        BulkRun run(MakeTransaction());
        const Work work = Gather(run.bulk);
        // Nobody finishes the edits: the failure ends the whole by itself, unless it is theirs.
        run.bulk->FinishedCreatingNewAssets();
        run.bulk->FinishedDeletingAssets();
        EXPECT_EQ(failing == 2 ? run.Finish() : run.Wait(), expected);
        const std::vector<Calls> calls{work.created, work.deleted, work.edited};
        for (std::size_t phase = 0; phase < 3; ++phase) {
            if (phase > failing) {
                EXPECT_THAT(calls[phase].Results(), IsEmpty()) << failing << phase;
                EXPECT_THAT(Writes(), testing::Not(testing::Contains(lines[phase])));
            } else {
                EXPECT_THAT(calls[phase].Results(), ElementsAre(phase < failing ? kResultSuccess : expected));
            }
        }
        EXPECT_TRUE(run.bulk->IsCompletelyFinished());
    }
}

TEST_F(BulkPhasesTest, AnswersThatDoNotFitAreFailures) {
    const auto json = [](const char* inText) { return ScriptedAnswer::JSON(Quote(inText)); };
    for (const char* text :
         {"{'assets':[{'assetId':'a'},{'assetId':'b'}]}", "{'assets':[{'assetId':'a','enclosures':[{},{}]}]}",
          "{'assets':[{'assetId':'a','renditions':[{}]}]}", "{'assets':{'assetId':'a'}}",
          "{'assets':[{'assetId':7}]}", "[", "'text'"}) {
        EXPECT_EQ(CreateWith(json(text), kResultFailure), kResultFailure) << text;
    }
    // Fewer than were sent: the form went through, but what became of this asset is not known.
    for (const char* text : {"{}", "{'assets':[]}", "{'assets':[{'assetId':''}]}", "{'assets':[{}]}"}) {
        EXPECT_EQ(CreateWith(json(text), kResultSuccess), kResultFailure) << text;
    }
    EXPECT_EQ(CreateWith(ScriptedAnswer::Status(200), kResultSuccess), kResultFailure);
}

TEST_F(BulkPhasesTest, AListThatCannotBeReadFailsTheEdits) {
    On("GET /A2/enclosures", ScriptedAnswer::Status(403));
    BulkRun run(MakeTransaction());
    Calls calls;
    run.bulk->SetAssetEnclosure(calls.Result(), "A2", "notes", Bytes("n"));
    EXPECT_EQ(run.Finish(), kResultHTTPForbidden);
    EXPECT_THAT(Writes(), IsEmpty());
    EXPECT_THAT(calls.Results(), IsEmpty());
}

TEST_F(BulkPhasesTest, ACancelReachesTheRequestUnderWay) {
    On("POST /t1/bulk/create", ScriptedAnswer::Hold());
    BulkRun run(MakeTransaction());
    const Work work = Gather(run.bulk);
    run.bulk->FinishedCreatingNewAssets();
    ASSERT_TRUE(net->WaitForRequests(2));
    run.parent->TryToCancel();
    EXPECT_EQ(run.Wait(), kResultCancelled);
    EXPECT_THAT(work.created.Results(), ElementsAre(testing::Lt(0)));
    EXPECT_THAT(work.deleted.Results(), IsEmpty());
    EXPECT_THAT(work.edited.Results(), IsEmpty());
    EXPECT_THAT(Writes(), SizeIs(1));
    EXPECT_FALSE(Add(run.bulk, work.created.Asset(), u"late"));
}

TEST_F(BulkPhasesTest, ItemsOfFormsThatWereNotBuiltAreToldTheFailure) {
    On("POST /t1/bulk/create", ScriptedAnswer::Status(409));
    BulkRun run(MakeTransaction());
    const auto megabyte = Bytes(std::string(1 << 20, 'm'));
    Calls calls;
    for (int i = 0; i < 120; ++i) {
        BulkNewAsset asset;
        asset.properties = Named(u"N");
        asset.enclosures.emplace("big", megabyte);
        run.bulk->CreateNewAsset(calls.Asset(), asset);
    }
    EXPECT_EQ(run.Finish(), kResultHTTPConflict);
    EXPECT_THAT(calls.Results(), testing::AllOf(SizeIs(120), Each(testing::Lt(0))));
    EXPECT_LE(Writes().size(), 2u);
}

TEST_F(BulkPhasesTest, AHostThatLetsGoHasGivenUp) {
    BulkRun run(MakeTransaction());
    const Work work = Gather(run.bulk);
    auto again = run.bulk->AddRefSelf();
    EXPECT_EQ(again, run.bulk);
    run.bulk.Reset();
    again.Reset();
    EXPECT_EQ(run.Wait(), kResultCancelled);
    EXPECT_THAT(Writes(), IsEmpty());
    EXPECT_THAT(work.created.Results(), IsEmpty());

    BulkRun finished(MakeTransaction());
    const Work sent = Gather(finished.bulk);
    finished.bulk->FinishedEditing();
    finished.bulk.Reset();
    EXPECT_EQ(finished.Wait(), kResultSuccess);
    EXPECT_THAT(Writes(), SizeIs(3));
    EXPECT_THAT(sent.edited.Results(), ElementsAre(kResultSuccess));
}

TEST_F(BulkPhasesTest, WhenThereIsNone) {
    EXPECT_FALSE(BulkRun(MakeSession()).bulk);
    const auto transaction = MakeTransaction();
    EXPECT_FALSE(transaction->CreateBulkTransaction(nullptr));
    EXPECT_FALSE(BulkRun(MakeTransaction("")).bulk);
    EXPECT_THAT(Assertions(), testing::Contains(testing::HasSubstr("!mBulkCreateLink.empty()")));
    ostcore::debug::DebugDatabase::SetOverride("ZOClient.EnableBulkAPI", "false");
    EXPECT_FALSE(BulkRun(transaction).bulk);
    ostcore::debug::DebugDatabase::SetOverride("ZOClient.EnableBulkAPI", "true");
    const auto failed = CompoundAsyncOperation::Create({}, server, false);
    failed->TryToCancel();
    EXPECT_FALSE(transaction->CreateBulkTransaction(failed));
    BulkRun first(transaction);
    ASSERT_TRUE(first.bulk);
    EXPECT_FALSE(BulkRun(transaction).bulk) << "the first has not ended";
    EXPECT_EQ(first.Finish(), kResultSuccess);
    BulkRun second(transaction);
    ASSERT_TRUE(second.bulk);
    EXPECT_EQ(second.Finish(), kResultSuccess);
}

TEST_F(BulkPhasesTest, EditsWithNothingToSend) {
    BulkRun run(MakeTransaction());
    Calls cleared;
    Calls unknown;
    run.bulk->SetAssetProperties(cleared.Result(), "A1", Named(u"X"), boost::none, boost::none);
    run.bulk->SetAssetProperties(cleared.Result(), "A1", boost::none, boost::none, boost::none);
    run.bulk->SetAssetProperties(unknown.Result(), "nobody", Named(u"X"), boost::none, boost::none);
    run.bulk->SetProductionEnclosure("there_xmp", Bytes("x"), true);
    EXPECT_EQ(run.Finish(), kResultSuccess);
    EXPECT_THAT(Writes(), IsEmpty());
    EXPECT_THAT(cleared.Results(), ElementsAre(kResultSuccess, kResultSuccess));
    EXPECT_THAT(unknown.Results(), ElementsAre(kResultHTTPNotFound));

    // Beside others, its completion follows the request.
    BulkRun mixed(MakeTransaction());
    Calls both;
    mixed.bulk->SetAssetProperties(both.Result(), "nobody", Named(u"X"), boost::none, boost::none);
    mixed.bulk->SetAssetEnclosure(both.Result(), "A1", "notes", Bytes("n"));
    EXPECT_EQ(mixed.Finish(), kResultSuccess);
    ExpectForm(LastRequest(), {{"assets+A1+enclosure+E1+data", kJSONType, "n"}});
    EXPECT_THAT(both.Results(), ElementsAre(kResultSuccess, kResultSuccess));
}

TEST_F(BulkPhasesTest, WhatCannotStandInAFormIsRefusedAndTheRestGoesOut) {
    BulkRun run(MakeTransaction());
    Calls good;
    Calls bad;
    run.bulk->DeleteAsset(bad.Result(), "A\r\nX-Evil: 1");
    run.bulk->DeleteAsset(good.Result(), "A1");
    EXPECT_EQ(run.Finish(), kResultNotStarted);
    ExpectForm(Last("POST", "/t1/bulk/delete"), {{"assets+A1", kTextType, ""}});
    EXPECT_THAT(bad.Results(), ElementsAre(kResultNotStarted));
    EXPECT_THAT(good.Results(), SizeIs(1));
}

TEST_F(BulkPhasesTest, RequestsOfTheCreateOperationMayAddAssets) {
    BulkRun run(MakeTransaction());
    On("GET /before", JSONAnswer("{}"));
    const auto bulk = run.bulk;
    const auto before = Plain("/before");
    Calls calls;
    run.bulk->GetCreateOperation()->Initiate(
        [before](const Guid& inID, const RequestCompletion& inDone) {
            return before->Load(inID, inDone, true);
        },
        [bulk, calls](int inResult) {
            EXPECT_TRUE(Add(bulk, calls.Asset(), u"N"));
            return inResult;
        });
    EXPECT_EQ(run.Finish(), kResultSuccess);
    EXPECT_THAT(calls.Results(), ElementsAre(kResultSuccess));
}

}  // namespace
}  // namespace ZOCL
