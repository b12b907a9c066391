// Many changes of a transaction at once: one form, one commit of the transaction, all of it or nothing. The
// answer lists what the form lists, in its order.
#include <unordered_map>
#include <unordered_set>

#include "Base/Digest.h"
#include "Base/Error.h"
#include "Base/Text.h"
#include "Routes/BulkForm.h"
#include "Routes/Documents.h"
#include "Routes/ItemRules.h"
#include "Routes/RouteTable.h"

namespace zohub {

namespace {

ItemData DataOf(BulkItem const& inItem) {
    return {inItem.part->bytes, inItem.part->contentType, inItem.hash};
}

std::string AnswerOfItem(char const* inIdKey, std::string const& inId, std::size_t inIndex) {
    std::string text = "{";
    AppendMember(text, inIdKey, inId);
    AppendRaw(text, "indexId", std::to_string(inIndex));
    return text;
}

void AppendToArray(std::string& ioArray, std::string_view inItem) {
    if (ioArray.back() != '[')
        ioArray += ',';
    ioArray += inItem;
}

void AppendAnswer(std::string& ioArray, EnclosureState const& inEnclosure, std::size_t inIndex) {
    std::string text = AnswerOfItem("enclosureId", inEnclosure.id, inIndex);
    AppendMember(text, "enclosureContentId", inEnclosure.content);
    AppendToArray(ioArray, text + '}');
}

void AppendAnswer(std::string& ioArray, RenditionState const& inRendition, std::size_t inIndex) {
    AppendToArray(ioArray, AnswerOfItem("renditionId", inRendition.id, inIndex) + '}');
}

template <class State>
bool SameData(State const& inLeft, State const& inRight) {
    return inLeft.content == inRight.content && inLeft.type == inRight.type;
}

// One form on its way into the transaction.
class BulkRun {
public:
    explicit BulkRun(Call& ioCall)
        : mCall(ioCall),
          mForm(*ioCall.payload.bulk),
          mView(OpenTransaction(ioCall)),
          mScope(ScopeOf(mView.line)) {
        std::vector<std::string> ids;
        for (auto const& asset : mForm.assets)
            if (!asset.id.empty())
                ids.emplace_back(asset.id);
        mPresent = AssetMap(ioCall.transaction, mView.tree.assets).FindAll(ids);
    }

    Response Create() {
        for (auto const& asset : mForm.assets) {
            AssetState state = asset.id.empty() ? NewAsset(asset) : Present(asset);
            Added const added{Add(asset.enclosures, state.enclosures, kMaxEnclosuresOfAsset),
                              Add(asset.renditions, state.renditions)};
            Put(asset, state, added);
        }
        auto all = mView.tree.enclosures;
        std::string const answer = Add(mForm.enclosures, all, kMaxEnclosuresOfProduction);
        PutEnclosures(std::move(all));
        return Finish("Added in bulk", answer);
    }

    Response Edit() {
        for (auto const& asset : mForm.assets) {
            AssetState state = Present(asset);
            if (asset.properties) {
                state.properties = asset.properties->properties;
                state.parent = asset.properties->parent;
                state.locator = asset.properties->locator;
            }
            Added const replaced{Replace(asset.enclosures, state.enclosures, "enclosure"),
                                 Replace(asset.renditions, state.renditions, "rendition")};
            Put(asset, state, replaced);
        }
        auto all = mView.tree.enclosures;
        std::string const answer = Replace(mForm.enclosures, all, "enclosure");
        PutEnclosures(std::move(all));
        return Finish("Changed in bulk", answer);
    }

    Response Delete() {
        for (auto const& asset : mForm.assets) {
            HashOf(asset);
            std::string const id(asset.id);
            mEdit.assets[id] = std::nullopt;
            Answer(asset, id, {});
        }
        return Finish("Removed in bulk", "[");
    }

private:
    // What answers for the enclosures and renditions of an asset: arrays without their ends.
    struct Added {
        std::string enclosures = "[";
        std::string renditions = "[";
    };

    static AssetState NewAsset(BulkAsset const& inAsset) {
        AssetState state = *inAsset.properties;
        state.id = NewKey(kLongKey);
        return state;
    }

    std::string const& HashOf(BulkAsset const& inAsset) const {
        auto const found = mPresent.find(std::string(inAsset.id));
        if (found != mPresent.end())
            return found->second;
        bool const isIndex = inAsset.id.find_first_not_of("0123456789") == std::string_view::npos;
        if (isIndex)
            mForm.Fail(*inAsset.part, 400, "bulk-properties-missing",
                       "There is no asset of this identifier, and a new one begins with its properties.");
        mForm.Fail(*inAsset.part, 404, "bulk-asset-unknown", "There is no asset of this identifier.");
    }

    AssetState Present(BulkAsset const& inAsset) const { return mCall.repository.LoadAsset(HashOf(inAsset)); }

    // What a rule refuses is refused in the name of the part.
    template <class Function>
    void InPart(FormPart const& inPart, Function const& inFunction) const {
        try {
            inFunction();
        } catch (Failure const& failure) {
            mForm.Fail(inPart, failure.Status(), failure.Code().c_str(), failure.what());
        }
    }

    std::string Add(std::vector<BulkItem> const& inItems, std::vector<EnclosureState>& ioEnclosures,
                    std::size_t inMost) const {
        std::string answer = "[";
        if (inItems.empty())
            return answer;
        ioEnclosures.reserve(ioEnclosures.size() + inItems.size());
        std::unordered_set<std::string_view> names;
        for (auto const& enclosure : ioEnclosures)
            names.insert(enclosure.name);
        for (auto const& item : inItems) {
            InPart(*item.part, [&] {
                if (!names.insert(item.name).second)
                    FailEnclosureExists();
                RequireRoomForEnclosure(ioEnclosures.size(), inMost);
                ioEnclosures.push_back(NewEnclosure(item.name, DataOf(item)));
            });
            mCall.repository.AddContent(item.hash, item.part->bytes);
            AppendAnswer(answer, ioEnclosures.back(), item.index);
        }
        return answer;
    }

    std::string Add(std::vector<BulkItem> const& inItems, std::vector<RenditionState>& ioRenditions) const {
        std::string answer = "[";
        for (auto const& item : inItems) {
            InPart(*item.part, [&] { RequireRoomForRendition(ioRenditions.size()); });
            ioRenditions.push_back(NewRendition(DataOf(item)));
            mCall.repository.AddContent(item.hash, item.part->bytes);
            AppendAnswer(answer, ioRenditions.back(), item.index);
        }
        return answer;
    }

    template <class State>
    std::string Replace(std::vector<BulkItem> const& inItems, std::vector<State>& ioStates,
                        std::string const& inWhat) const {
        std::string answer = "[";
        if (inItems.empty())
            return answer;
        std::unordered_map<std::string_view, State*> byId;
        for (auto& state : ioStates)
            byId.emplace(state.id, &state);
        for (auto const& item : inItems) {
            auto const found = byId.find(item.id);
            if (found == byId.end())
                mForm.Fail(*item.part, 404, "bulk-item-unknown",
                           "There is no " + inWhat + " of this identifier here.");
            SetData(*found->second, DataOf(item));
            mCall.repository.AddContent(item.hash, item.part->bytes);
            AppendAnswer(answer, *found->second, item.index);
        }
        return answer;
    }

    void Put(BulkAsset const& inAsset, AssetState const& inState, Added const& inAdded) {
        std::string hash = mCall.repository.AddAsset(mScope, inState);
        bool const isSame = !inAsset.id.empty() && hash == HashOf(inAsset);
        if (!isSame)
            mEdit.assets[inState.id] = std::move(hash);
        Answer(inAsset, inState.id, inAdded);
    }

    // The list as it is, with some changed in place and some more at its end.
    void PutEnclosures(std::vector<EnclosureState> inEnclosures) {
        auto const& present = mView.tree.enclosures;
        bool hasChanged = false;
        for (std::size_t i = 0; i < inEnclosures.size(); ++i) {
            if (i < present.size() && SameData(present[i], inEnclosures[i]))
                continue;
            hasChanged = true;
            mCall.repository.AddEnclosureReference(mScope, inEnclosures[i]);
        }
        if (hasChanged)
            mEdit.enclosures = std::move(inEnclosures);
    }

    void Answer(BulkAsset const& inAsset, std::string const& inId, Added const& inAdded) {
        std::string text = AnswerOfItem("assetId", inId, inAsset.index);
        AppendRaw(text, "enclosures", inAdded.enclosures + ']');
        AppendRaw(text, "renditions", inAdded.renditions + ']');
        AppendToArray(mAssets, text + '}');
    }

    Response Finish(char const* inTitle, std::string const& inEnclosures) {
        if (mEdit.enclosures || !mEdit.assets.empty())
            mCall.repository.CommitEdit(mView, mEdit, inTitle, mCall.actor, mCall.now);
        return JsonResponse(200, "{\"assets\":" + mAssets + "],\"enclosures\":" + inEnclosures + "]}");
    }

    Call& mCall;
    BulkForm const& mForm;
    View mView;
    std::string const mScope;
    std::map<std::string, std::string> mPresent;  // of the assets that the form names
    Repository::Edit mEdit;
    std::string mAssets = "[";
};

}  // namespace

void AddBulkRoutes(std::vector<Route>& ioRoutes) {
    auto const add = [&ioRoutes](char const* inMethod, char const* inTail, BulkKind inKind,
                                 Response (BulkRun::*inRun)()) {
        Route route;
        route.method = inMethod;
        route.pattern = std::string(kApiPath) + "/p/{}/bulk/" + inTail;
        route.prepare = [inKind](Request const& inRequest) {
            Payload payload;
            payload.bulk = ReadBulkForm(inKind, inRequest);
            return payload;
        };
        route.handle = [inRun](Call& ioCall) { return (BulkRun(ioCall).*inRun)(); };
        ioRoutes.push_back(std::move(route));
    };
    add("POST", "create", BulkKind::Creation, &BulkRun::Create);
    add("PUT", "edit", BulkKind::Edit, &BulkRun::Edit);
    add("POST", "delete", BulkKind::Deletion, &BulkRun::Delete);
}

}  // namespace zohub
