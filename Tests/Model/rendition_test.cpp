// Renditions: finding, reading and creating them.
#include "Model/Renditions.h"
#include "ModelTest.h"

namespace ZOCL {
namespace {

std::string RenditionText(const std::string& inID, const std::string& inFlavor) {
    return "{'zo:renditionId':'" + inID + "','zo:renditionContentId':'c-" + inID +
           "','properties':{'zo:mimeType':'" + inFlavor + "'},'links':[" +
           LinkTo(kRelation_Renditions_Rendition, "/r/" + inID) + "," +
           LinkTo(kRelation_EditMedia, "/up/" + inID) + "]}";
}

class RenditionTest : public ModelTest {
protected:
    InterfaceRef<Renditions> MakeList() {
        return Make<Renditions>(
            "{'renditions':[" + RenditionText("1", "image/png") + "," + RenditionText("2", "video/mp4") +
            "," + RenditionText("3", "image/png") +
            ",{'zo:renditionId':'4','properties':{'zo:mimeType':'image/jpeg'}}],'links':[" +
            LinkTo(kRelation_Create, "/new") + "]}");
    }
};

TEST_F(RenditionTest, FirstOfAFlavorWins) {
    const auto list = MakeList();
    const auto found = list->FindRendition(IZOCRendition::kFlavorPNG);
    ASSERT_TRUE(found);
    EXPECT_EQ(found->GetRenditionID().view(), "1");
    EXPECT_EQ(found->GetContentID().view(), "c-1");
    EXPECT_EQ(found->GetFlavor(), IZOCRendition::kFlavorPNG);
    EXPECT_EQ(found->GetPayloadResource(false)->GetHTTPURL(), HubURL("/r/1"));
    EXPECT_EQ(found->GetPayloadResource(true)->GetHTTPURL(), HubURL("/up/1"));
    EXPECT_FALSE(RFL::QueryInterface<IZOCWritableServerResource>(found->GetPayloadResource(true)));
    EXPECT_EQ(list->FindRendition(std::string("video/mp4"))->GetRenditionID().view(), "2");
    EXPECT_FALSE(list->FindRendition(std::string("video/webm")));
    EXPECT_FALSE(list->FindRendition(IZOCRendition::kFlavorJPEG)->GetPayloadResource(false));
    EXPECT_EQ(list->GetRenditionIDs().size(), 4u);
    EXPECT_EQ(list->GetFlavors()[1], IZOCRendition::kFlavorMP4);
    EXPECT_EQ(list->GetRenditionFactoryURL(), HubURL("/new"));
    EXPECT_EQ(Requests(), 0u);
}

TEST_F(RenditionTest, PayloadComesFromItsLink) {
    const auto list = MakeList();
    net->Expect("GET", HubURL("/r/1").str(), ScriptedAnswer::Body("png", "image/png"));
    EXPECT_EQ(list->GetRenditionPayload(IZOCRendition::kFlavorPNG)->payload->view(), "png");
    EXPECT_FALSE(list->GetRenditionPayload(IZOCRendition::kFlavorJPEG));
    EXPECT_FALSE(list->GetRenditionPayload("video/webm"));
    EXPECT_EQ(Requests(), 1u);
}

TEST_F(RenditionTest, ListWithoutRenditionsIsEmpty) {
    const auto list = Make<Renditions>("{}");
    EXPECT_TRUE(list->GetRenditionIDs().empty());
    EXPECT_FALSE(list->FindRendition(IZOCRendition::kFlavorPNG));
}

TEST_F(RenditionTest, CreationPostsTheBytes) {
    net->Expect("POST", HubURL("/new").str(), JSONAnswer(RenditionText("9", "image/png")));
    Outcome outcome;
    ASSERT_TRUE(IZOCWritableRenditions::CreateRendition(server, HubURL("/new"), IZOCRendition::kFlavorPNG,
                                                        Bytes("x"), Guid::CreateUnique(),
                                                        outcome.Function()));
    EXPECT_EQ(outcome.Wait(), kResultSuccess);
    EXPECT_EQ(LastRequest().Header("Content-Type"), "image/png");
    EXPECT_EQ(LastRequest().body, "x");
    EXPECT_EQ(RFL::QueryInterface<IZOCRendition>(outcome.Resource())->GetRenditionID().view(), "9");
    EXPECT_FALSE(IZOCWritableRenditions::CreateRendition(server, ImmutableString(), IZOCRendition::kFlavorPNG,
                                                         Bytes("x"), Guid::CreateUnique(),
                                                         RequestCompletion()));
}

}  // namespace
}  // namespace ZOCL
