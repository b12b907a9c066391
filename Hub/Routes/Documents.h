// The JSON documents of the protocol, written straight into text: lists of many thousand items are made of
// them.
#pragma once

#include <string>
#include <string_view>

#include "Model/Repository.h"

namespace zohub {

inline constexpr std::string_view kRelationBase = "http://ns.meridane.example/zo/rel";

/// Writes the value of "links": an array of link objects.
class LinkWriter {
public:
    explicit LinkWriter(std::string& ioTarget) : mTarget(ioTarget) { mTarget += '['; }
    LinkWriter(LinkWriter const&) = delete;
    LinkWriter& operator=(LinkWriter const&) = delete;
    ~LinkWriter() { mTarget += ']'; }

    /// A relation that is a plain word, such as "self".
    void Plain(std::string_view inRelation, std::string_view inHref) { Write({}, inRelation, inHref); }
    /// A relation below kRelationBase, such as "/assets".
    void Named(std::string_view inRelation, std::string_view inHref) {
        Write(kRelationBase, inRelation, inHref);
    }

private:
    void Write(std::string_view inBase, std::string_view inRelation, std::string_view inHref);

    std::string& mTarget;
    bool mIsFirst = true;
};

/// ,"key":<json> with the comma left out after an opening brace.
void AppendRaw(std::string& ioTarget, std::string_view inKey, std::string_view inJson);
/// The same for the key "links", whose value a LinkWriter then writes.
void BeginLinks(std::string& ioTarget);

/// Writes documents of one view of a production. All hrefs begin with the address that the client used.
class DocumentWriter {
public:
    DocumentWriter(std::string const& inApi, View const& inView);

    std::string LivePrefix() const { return mLivePrefix; }  ///< ".../p/<id>"
    std::string Prefix() const { return mPrefix; }          ///< with the commit when the view is pinned

    std::string ProductionTag() const;
    std::string AssetTag(std::string_view inHash) const;
    std::string EnclosureTag(EnclosureState const& inEnclosure) const;
    std::string RenditionTag(RenditionState const& inRendition) const;

    /// The document of the line: a production, a template, a session or a transaction.
    std::string Production() const;
    /// One item of a production list. The time is that of the last change on the production or a session.
    void AppendProductionItem(std::string& ioTarget, Micros inLastModifiedOfAll) const;

    void AppendAsset(std::string& ioTarget, AssetState const& inAsset, std::string const& inHash,
                     bool inIsFull) const;

    /// Lists of their own. inOwner is the prefix of an asset or of the production.
    std::string EnclosureList(std::string const& inOwner,
                              std::vector<EnclosureState> const& inEnclosures) const;
    std::string RenditionList(std::string const& inOwner,
                              std::vector<RenditionState> const& inRenditions) const;
    void AppendEnclosure(std::string& ioTarget, std::string const& inOwner,
                         EnclosureState const& inEnclosure) const;
    void AppendRendition(std::string& ioTarget, std::string const& inOwner,
                         RenditionState const& inRendition) const;

    std::string AssetHref(std::string const& inAssetId) const;
    bool IsWritable() const { return mView.mayWrite && !mView.isPinned; }
    /// The view is the live state of the reader's own session.
    bool IsManageable() const { return mView.mayManage && !mView.isPinned; }

private:
    std::string TagOf(std::string_view inKind, std::string_view inWhatDecides) const;
    std::string LiveHref(std::string const& inHref) const;
    void AppendEnclosureItems(std::string& ioTarget, std::string const& inOwner,
                              std::vector<EnclosureState> const& inEnclosures) const;
    void AppendRenditionItems(std::string& ioTarget, std::string const& inOwner,
                              std::vector<RenditionState> const& inRenditions) const;
    void AppendContainedLists(std::string& ioTarget, std::string const& inOwner,
                              AssetState const& inAsset) const;
    void WriteFactoryLinks(LinkWriter& ioLinks, std::string const& inList) const;
    void AppendIdentity(std::string& ioTarget) const;
    void AppendLineLinks(std::string& ioTarget) const;
    void WriteContentLinks(LinkWriter& ioLinks) const;
    void WriteProductionLinks(LinkWriter& ioLinks) const;
    void WriteSessionLinks(LinkWriter& ioLinks) const;
    void WriteTransactionLinks(LinkWriter& ioLinks) const;
    std::string ParentPrefix() const;

    std::string const& mApi;
    View const& mView;
    std::string const mLivePrefix;
    std::string const mPrefix;
};

/// One item of the list of a production's sessions, or of a session's transactions.
void AppendSessionItem(std::string& ioTarget, std::string const& inApi, LineRecord const& inLine);
void AppendTransactionItem(std::string& ioTarget, std::string const& inApi, LineRecord const& inLine);

}  // namespace zohub
