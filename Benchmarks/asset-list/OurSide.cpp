#include "dto/Asset.h"
#include "Sides.h"

using namespace ZOCL;
using ostcore::serialization::JSONParse;
using ostcore::serialization::JSONView;
using ostcore::serialization::ReadTicks;

namespace {

void AddLinks(const ostcore::serialization::BoundObject& inObject, Digest& ioDigest) {
    JSONView(inObject.Body()).Find("links").ForEachElement([&](JSONView inLink) {
        ++ioDigest.links;
        ioDigest.textBytes += inLink.Find("rel").AsString().size() + inLink.Find("href").AsString().size();
    });
}

void AddProperties(const dto::AssetProperties& inProperties, Digest& ioDigest) {
    ioDigest.textBytes += inProperties.Name().size() + inProperties.Description().size() +
                          inProperties.MediaLocator().size() + inProperties.Parent().size() +
                          inProperties.AssetType().size();
    for (const auto& tag : inProperties.Tags()) {
        ioDigest.textBytes += tag.size();
    }
    const auto subClip = inProperties.Structure<dto::SubClip>("subClip");
    ioDigest.ticks +=
        inProperties.Ticks("zeroPoint") + subClip.Ticks("mStartBoundary") + subClip.Ticks("mEndBoundary");
}

}  // namespace

void RunOurs(const Body& inBody) {
    const dto::ContainedAssets assets(JSONParse(inBody));
}

Digest DigestOfOurs(const Body& inBody) {
    const dto::ContainedAssets list(JSONParse(inBody));
    Digest digest;
    AddLinks(list, digest);
    for (const dto::Asset& asset : list.Assets()) {
        ++digest.assets;
        digest.textBytes += asset.Identifier().size() + asset.GetETag().size() + asset.ContentID().size();
        AddProperties(asset.Properties(), digest);
        AddLinks(asset, digest);
        for (const dto::Enclosure& enclosure : asset.Enclosures().Enclosures()) {
            digest.textBytes +=
                enclosure.GetETag().size() + enclosure.ContentID().size() + enclosure.Name().size();
            AddLinks(enclosure, digest);
        }
        for (const dto::Rendition& rendition : asset.Renditions().Renditions()) {
            digest.textBytes += rendition.Identifier().size() + rendition.MimeType().size();
            AddLinks(rendition, digest);
        }
    }
    return digest;
}
