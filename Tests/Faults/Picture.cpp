#include "Picture.h"

#include <boost/date_time/posix_time/time_formatters.hpp>

#include "ostcore/utility/StringConversion.h"

namespace faults {
namespace {

class Lines {
public:
    Lines& Add(const char* inName, const ImmutableString& inValue) { return Add(inName, inValue.str()); }
    Lines& Add(const char* inName, const ostcore::UString& inValue) {
        return Add(inName, ostcore::utility::ToUTF8(inValue));
    }
    Lines& Add(const char* inName, const std::string& inValue) {
        mText += std::string(inName) + "=" + inValue + "\n";
        return *this;
    }
    const std::string& Text() const { return mText; }

private:
    std::string mText;
};

std::string TimeText(const ostcore::ptime& inTime) {
    return inTime.is_not_a_date_time() ? "" : boost::posix_time::to_iso_string(inTime);
}

void Draw(Lines& ioLines, const InterfaceRef<IZOCEnclosures>& inEnclosures) {
    if (!inEnclosures) {
        return;
    }
    for (const ImmutableString& name : inEnclosures->GetEnclosureNames()) {
        ioLines.Add("enclosure", name);
        if (const auto enclosure = inEnclosures->GetEnclosure(name)) {
            ioLines.Add("content", enclosure->GetEnclosureContentID()).Add("id", enclosure->GetEnclosureID());
        }
    }
    for (const ImmutableString& id : inEnclosures->GetEnclosureIDs()) {
        ioLines.Add("enclosure id", id);
    }
}

void Draw(Lines& ioLines, const InterfaceRef<IZOCAsset>& inAsset) {
    if (!inAsset) {
        ioLines.Add("asset", std::string("none"));
        return;
    }
    ImmutableString type;
    ioLines.Add("typed", std::string(inAsset->GetAssetType(type) ? "yes" : "no")).Add("type", type);
    ioLines.Add("type name", inAsset->GetAssetTypeDisplayName()).Add("name", inAsset->GetName());
    ioLines.Add("description", inAsset->GetDescription()).Add("id", inAsset->GetAssetIdentifier());
    ioLines.Add("locator", inAsset->GetMediaLocatorIdentifier());
    ioLines.Add("parent", inAsset->GetParentAssetIdentifier());
    ioLines.Add("content", inAsset->GetContentIdentifier());
    for (const ImmutableString& tag : inAsset->GetTags()) {
        ioLines.Add("tag", tag);
    }
    ioLines.Add("zero", std::to_string(inAsset->GetAssetBaseProperties().zeroPoint.Ticks()));
    ZOCL::SubClip clip;
    if (inAsset->GetSubClip(clip)) {
        ioLines.Add("start", std::to_string(clip.startBoundary.Ticks()));
        ioLines.Add("hard", std::string(clip.boundaryIsHard ? "yes" : "no"));
    }
    Draw(ioLines, inAsset->GetEnclosures());
    if (const auto renditions = inAsset->GetRenditions()) {
        for (const ImmutableString& flavor : renditions->GetFlavors()) {
            ioLines.Add("rendition", flavor);
        }
    }
}

void Draw(Lines& ioLines, const InterfaceRef<IZOCAssetList>& inAssets) {
    for (const auto& item : inAssets->GetAllItems()) {
        ioLines.Add("item", item.name).Add("id", item.assetIdentifier).Add("parent", item.parentIdentifier);
        ioLines.Add("tag", item.eTag).Add("type", item.assetType);
        ioLines.Add("locator", item.mediaLocatorIdentifier);
        Draw(ioLines, inAssets->GetAssetByIdentifier(item.assetIdentifier));
        Draw(ioLines, inAssets->GetAssetByName(item.name));
    }
    ioLines.Add("of type", std::to_string(inAssets->GetAssetsByType(ZOCL::kAssetType_MasterClip).size()));
    ioLines.Add("in bin",
                std::to_string(inAssets->GetAssetsWithParentIdentifier(ImmutableString("bin")).size()));
}

void Draw(Lines& ioLines, const InterfaceRef<IZOCProduction>& inProduction) {
    ioLines.Add("name", inProduction->GetName()).Add("description", inProduction->GetDescription());
    ioLines.Add("id", inProduction->GetIdentifier()).Add("owner", inProduction->GetOwner());
    ioLines.Add("commit", inProduction->GetLoadedRevision());
    ioLines.Add("created", TimeText(inProduction->GetCreationTime()));
    ioLines.Add("modified", TimeText(inProduction->GetModificationTime()));
    for (const ImmutableString& tag : inProduction->GetTags()) {
        ioLines.Add("tag", tag);
    }
    const auto assets = AsResource(inProduction->GetAssets());
    ioLines.Add("assets", assets ? assets->GetHTTPURL() : ImmutableString("none"));
    const auto enclosures = AsResource(inProduction->GetEnclosures());
    ioLines.Add("enclosures", enclosures ? enclosures->GetHTTPURL() : ImmutableString("none"));
    const auto latest = AsResource(inProduction->GetLatestVersion());
    ioLines.Add("latest", latest ? latest->GetHTTPURL() : ImmutableString("none"));
}

void Draw(Lines& ioLines, const InterfaceRef<IZOCProductionList>& inList) {
    for (const auto& entry : inList->GetAllItems()) {
        ioLines.Add("entry", entry.name).Add("description", entry.description).Add("id", entry.identifier);
        ioLines.Add("owner", entry.owner).Add("url", entry.url);
        ioLines.Add("modified", TimeText(entry.lastModified));
        ioLines.Add("sessions", TimeText(entry.lastModifiedOfAllSessions));
    }
    const auto next = AsResource(inList->GetNextPage());
    ioLines.Add("next", next ? next->GetHTTPURL() : ImmutableString("none"));
}

template <class Interface>
void DrawAs(Lines& ioLines, const InterfaceRef<IZOCServerResource>& inResource) {
    const auto object = RFL::QueryInterface<Interface>(inResource);
    ASSERT_TRUE(object) << "the object does not answer the interface of its kind";
    Draw(ioLines, object);
}

}  // namespace

std::string PictureOf(Step inStep, const InterfaceRef<IZOCServerResource>& inResource) {
    Lines lines;
    try {
        if (inStep == Step::kProductions) {
            DrawAs<IZOCProductionList>(lines, inResource);
        } else if (inStep == Step::kProduction) {
            DrawAs<IZOCProduction>(lines, inResource);
        } else if (inStep == Step::kAssets) {
            DrawAs<IZOCAssetList>(lines, inResource);
        } else if (inStep == Step::kEnclosures) {
            DrawAs<IZOCEnclosures>(lines, inResource);
        } else {
            ADD_FAILURE() << "there is no picture of " << NameOf(inStep);
        }
    } catch (const std::exception& failure) {
        ADD_FAILURE() << "an accessor throws: " << failure.what();
        lines.Add("exception", std::string(failure.what()));
    }
    return lines.Text();
}

}  // namespace faults
