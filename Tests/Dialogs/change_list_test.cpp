// Which lines the Share window has for which differences.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "Dialogs/PublishChangeList.h"

namespace ZOCL {
namespace {

IZOCDifferences::Entry Entry(const char* inID, const char* inName, const ImmutableString& inType) {
    IZOCDifferences::Entry entry;
    entry.identifier = ImmutableString(inID);
    entry.name = ImmutableString(inName);
    entry.differenceType = inType;
    return entry;
}

ProductionItemData Item(const char* inID, const ImmutableString& inType, const char* inLocator = "") {
    ProductionItemData item;
    item.assetIdentifier = item.displayName = ImmutableString(inID);
    item.path = ImmutableString("/Bin");
    item.type = inType;
    item.mediaLocatorIdentifier = ImmutableString(inLocator);
    return item;
}

TEST(ChangeListTest, EachChangeHasOneLineThatItsUserUnderstands) {
    const ImmutableString &add = kDifferenceType_Added, &edit = kDifferenceType_Updated,
                          &cut = kDifferenceType_Removed;
    const std::vector<ProductionItemData> items{
        Item("bin", kAssetType_Bin), Item("clip", kAssetType_MasterClip, "loc"),
        Item("sub", kAssetType_SubClip, "loc"), Item("old", kAssetType_Sequence),
        Item("new", ImmutableString("x"))};
    const PublishChanges changes{
        {Entry("bin", "b", edit), Entry("new", "n", add), Entry("old", "o", cut),
         Entry("lost", "cannot be had any more", cut), Entry("unlisted", "named by the hub", add)},
        {Entry("", "loc_xmp", edit), Entry("", "loc_xmp", edit), Entry("sub", "data", add),
         Entry("bin", "data", add), Entry("lost", "data", cut), Entry("", "notes.txt", cut)},
        {Entry("", "p", edit)}};
    std::vector<std::string> lines;
    for (const ostui::TreeRow& row : MakePublishRows(items, changes)) {
        lines.push_back(row.icon + ":" + row.cells[0] + "|" + row.cells[1] + "|" + row.cells[2] + "|" +
                        row.cells[3]);
    }
    EXPECT_THAT(lines, testing::ElementsAre(
                           "SP_Folder_Sm:bin|Edit|Asset|/Bin", ":new|Add|Asset|/Bin",
                           "SP_Sequence_Sm:old|Delete|Asset|/Bin", ":named by the hub|Add|Asset|",
                           "SP_Tag_Md:clip XMP|Edit|XMP Metadata|/Bin",
                           "SP_VideoSubClip_Sm:sub|Edit|Asset|/Bin", ":notes.txt|Delete|Attached Data|",
                           "SP_Production_Sm:Production Settings|Edit|Production Settings|"));
    EXPECT_TRUE(MakePublishRows(items, ReadPublishChanges(nullptr)).empty());
}

}  // namespace
}  // namespace ZOCL
