// The JSON documents of the protocol.
#include "Routes/Documents.h"

#include "Base/Text.h"
#include "Http/Message.h"

namespace zohub {

void LinkWriter::Write(std::string_view inBase, std::string_view inRelation, std::string_view inHref) {
    mTarget += mIsFirst ? "{\"rel\":\"" : ",{\"rel\":\"";
    mIsFirst = false;
    mTarget += inBase;
    mTarget += inRelation;
    mTarget += "\",\"href\":";
    AppendJsonString(mTarget, inHref);
    mTarget += '}';
}

DocumentWriter::DocumentWriter(std::string const& inApi, View const& inView)
    : mApi(inApi),
      mView(inView),
      mLivePrefix(inApi + "/p/" + PercentEncode(inView.line.id)),
      mPrefix(inView.isPinned ? mLivePrefix + "/at/" + PercentEncode(inView.commit.id) : mLivePrefix) {}

std::string DocumentWriter::TagOf(std::string_view inKind, std::string_view inWhatDecides) const {
    std::string text(inKind);
    text += mView.isPinned ? "\npinned\n" : "\nlive\n";
    text += IsWritable() ? "w\n" : IsManageable() ? "m\n" : "r\n";
    text += inWhatDecides;
    return MakeETag(text);
}

std::string DocumentWriter::AssetTag(std::string_view inHash) const {
    return TagOf("asset", inHash);
}

std::string DocumentWriter::EnclosureTag(EnclosureState const& inEnclosure) const {
    return TagOf("enclosure", inEnclosure.id + "\n" + inEnclosure.name + "\n" + inEnclosure.type + "\n" +
                                  inEnclosure.content);
}

std::string DocumentWriter::RenditionTag(RenditionState const& inRendition) const {
    return TagOf("rendition", inRendition.id + "\n" + inRendition.type + "\n" + inRendition.content);
}

std::string DocumentWriter::AssetHref(std::string const& inAssetId) const {
    return mPrefix + "/a/" + PercentEncode(inAssetId);
}

std::string DocumentWriter::LiveHref(std::string const& inHref) const {
    return mLivePrefix + inHref.substr(mPrefix.size());
}

void DocumentWriter::AppendAsset(std::string& ioTarget, AssetState const& inAsset, std::string const& inHash,
                                 bool inIsFull) const {
    std::string const href = AssetHref(inAsset.id);
    ioTarget += '{';
    AppendMember(ioTarget, "zo:assetId", inAsset.id);
    AppendMember(ioTarget, "zo:etag", AssetTag(inHash));
    AppendMember(ioTarget, "zo:assetContentId", inHash);
    AppendRaw(ioTarget, "properties", inAsset.properties);
    BeginLinks(ioTarget);
    {
        LinkWriter links(ioTarget);
        links.Plain("self", href);
        links.Plain("latest-version", LiveHref(href));
        links.Named("/enclosures", href + "/e");
        links.Named("/renditions", href + "/r");
        if (!inAsset.locator.empty())
            links.Plain("locator", mApi + "/l/" + PercentEncode(inAsset.locator));
        if (IsWritable()) {
            links.Plain("edit", href);
            links.Plain("delete", href);
            links.Named("/enclosures/enclosure#create", href + "/e");
            links.Named("/renditions/rendition#create", href + "/r");
        }
    }
    if (inIsFull)
        AppendContainedLists(ioTarget, href, inAsset);
    ioTarget += '}';
}

void DocumentWriter::AppendEnclosureItems(std::string& ioTarget, std::string const& inOwner,
                                          std::vector<EnclosureState> const& inEnclosures) const {
    ioTarget += "{\"enclosures\":[";
    for (auto const& enclosure : inEnclosures) {
        if (ioTarget.back() != '[')
            ioTarget += ',';
        AppendEnclosure(ioTarget, inOwner, enclosure);
    }
    ioTarget += ']';
}

void DocumentWriter::AppendRenditionItems(std::string& ioTarget, std::string const& inOwner,
                                          std::vector<RenditionState> const& inRenditions) const {
    ioTarget += "{\"renditions\":[";
    for (auto const& rendition : inRenditions) {
        if (ioTarget.back() != '[')
            ioTarget += ',';
        AppendRendition(ioTarget, inOwner, rendition);
    }
    ioTarget += ']';
}

void DocumentWriter::WriteFactoryLinks(LinkWriter& ioLinks, std::string const& inList) const {
    if (IsWritable())
        ioLinks.Plain("create", inList);
}

std::string DocumentWriter::EnclosureList(std::string const& inOwner,
                                          std::vector<EnclosureState> const& inEnclosures) const {
    std::string text;
    AppendEnclosureItems(text, inOwner, inEnclosures);
    BeginLinks(text);
    {
        LinkWriter links(text);
        links.Plain("self", inOwner + "/e");
        links.Plain("latest-version", LiveHref(inOwner) + "/e");
        links.Named("/enclosures/enclosure#byContentId", mLivePrefix + "/ce/{contentId}");
        WriteFactoryLinks(links, inOwner + "/e");
        if (IsManageable() && inOwner == mPrefix)
            links.Plain("create", inOwner + "/e");
    }
    text += '}';
    return text;
}

std::string DocumentWriter::RenditionList(std::string const& inOwner,
                                          std::vector<RenditionState> const& inRenditions) const {
    std::string text;
    AppendRenditionItems(text, inOwner, inRenditions);
    BeginLinks(text);
    {
        LinkWriter links(text);
        links.Plain("self", inOwner + "/r");
        links.Plain("latest-version", LiveHref(inOwner) + "/r");
        WriteFactoryLinks(links, inOwner + "/r");
    }
    text += '}';
    return text;
}

// What an asset contains has its address from the asset's own links; these are the ones that it has not.
void DocumentWriter::AppendContainedLists(std::string& ioTarget, std::string const& inOwner,
                                          AssetState const& inAsset) const {
    ioTarget += ",\"enclosures\":";
    AppendEnclosureItems(ioTarget, inOwner, inAsset.enclosures);
    BeginLinks(ioTarget);
    {
        LinkWriter links(ioTarget);
        links.Named("/enclosures/enclosure#byContentId", mLivePrefix + "/ce/{contentId}");
        WriteFactoryLinks(links, inOwner + "/e");
    }
    ioTarget += "},\"renditions\":";
    AppendRenditionItems(ioTarget, inOwner, inAsset.renditions);
    BeginLinks(ioTarget);
    {
        LinkWriter links(ioTarget);
        WriteFactoryLinks(links, inOwner + "/r");
    }
    ioTarget += '}';
}

void DocumentWriter::AppendEnclosure(std::string& ioTarget, std::string const& inOwner,
                                     EnclosureState const& inEnclosure) const {
    std::string const href = inOwner + "/e/" + PercentEncode(inEnclosure.id);
    ioTarget += '{';
    AppendMember(ioTarget, "zo:etag", EnclosureTag(inEnclosure));
    AppendMember(ioTarget, "zo:enclosureContentId", inEnclosure.content);
    AppendMember(ioTarget, "zo:enclosureId", inEnclosure.id);
    AppendMember(ioTarget, "name", inEnclosure.name);
    BeginLinks(ioTarget);
    {
        LinkWriter links(ioTarget);
        links.Plain("self", href);
        links.Named("/enclosures/enclosure", mLivePrefix + "/pe/" + inEnclosure.content);
        if (mView.isPinned)
            links.Plain("latest-version", LiveHref(href));
        if (IsWritable() || (inEnclosure.isNote && IsManageable()))
            links.Plain("edit", href);
    }
    ioTarget += '}';
}

void DocumentWriter::AppendRendition(std::string& ioTarget, std::string const& inOwner,
                                     RenditionState const& inRendition) const {
    std::string const href = inOwner + "/r/" + PercentEncode(inRendition.id);
    ioTarget += '{';
    AppendMember(ioTarget, "zo:renditionId", inRendition.id);
    AppendMember(ioTarget, "zo:renditionContentId", inRendition.content);
    ioTarget += ",\"properties\":{\"zo:mimeType\":";
    AppendJsonString(ioTarget, inRendition.type);
    ioTarget += '}';
    BeginLinks(ioTarget);
    {
        LinkWriter links(ioTarget);
        links.Plain("self", href);
        links.Named("/renditions/rendition", mLivePrefix + "/pr/" + inRendition.content);
        if (mView.isPinned)
            links.Plain("latest-version", LiveHref(href));
        if (IsWritable())
            links.Plain("edit-media", href + "/media");
    }
    ioTarget += '}';
}

}  // namespace zohub
