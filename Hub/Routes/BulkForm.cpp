// Reading of bulk forms: the order of their parts, content types, properties and hashes.
#include "Routes/BulkForm.h"

#include <algorithm>
#include <unordered_set>

#include "Base/Digest.h"
#include "Base/Error.h"
#include "Base/Text.h"
#include "Routes/BulkPartName.h"

namespace zohub {

namespace {

using Kind = BulkPartName::Kind;

// 32 MiB of the smallest parts, those of a deletion, and some more.
constexpr std::size_t kMaxBulkParts = 400000;
constexpr std::size_t kLongestShownName = 600;

bool IsOfType(FormPart const& inPart, std::string_view inType) {
    return EqualIgnoringCase(Trim(Split(inPart.contentType, ';')[0]), inType);
}

class BulkReader {
public:
    explicit BulkReader(Request const& inRequest) {
        mForm.form = std::make_unique<Form const>(inRequest, kMaxBulkParts);
    }

    BulkForm Read(BulkKind inKind) {
        auto const& parts = mForm.form->Parts();
        if (parts.empty())
            throw Failure(400, "bulk-form-empty", "The form has no parts, so there is nothing to do.");
        mPartNames.reserve(parts.size());
        for (auto const& part : parts) {
            BulkPartName const name = NameOf(part);
            if (inKind == BulkKind::Creation)
                TakeCreation(part, name);
            else if (inKind == BulkKind::Edit)
                TakeEdit(part, name);
            else
                TakeDeletion(part, name);
        }
        RefuseNameWithoutData();
        return std::move(mForm);
    }

private:
    BulkPartName NameOf(FormPart const& inPart) {
        auto const name = ReadBulkPartName(inPart.name);
        if (!name)
            mForm.Fail(inPart, 400, "bulk-part-unknown", "No part of a bulk form has such a name.");
        if (!mPartNames.insert(inPart.name).second)
            mForm.Fail(inPart, 400, "bulk-part-repeated", "The form has two parts of this name.");
        return *name;
    }

    void TakeCreation(FormPart const& inPart, BulkPartName const& inName) {
        if (inName.kind == Kind::EnclosureData)
            return TakeNewEnclosure(inPart, inName);
        RefuseNameWithoutData();
        switch (inName.kind) {
            case Kind::AssetProperties:
                return StartNewAsset(inPart, inName);
            case Kind::EnclosureName:
                RequireIndex(inPart, inName.item, EnclosuresOf(inPart, inName).size());
                RequireText(inPart);
                mNamePart = &inPart;
                return;
            case Kind::RenditionData: {
                auto& renditions = AssetOf(inPart, inName).renditions;
                RequireIndex(inPart, inName.item, renditions.size());
                RequireMediaType(inPart);
                return Add(renditions, inPart, {}, {});
            }
            default:
                RefuseHere(inPart);
        }
    }

    void StartNewAsset(FormPart const& inPart, BulkPartName const& inName) {
        RequireIndex(inPart, inName.asset, mNewAssets);
        BulkAsset& asset = StartAsset(inPart, inName.asset);
        asset.id = {};
        asset.index = mNewAssets++;
        asset.properties = PropertiesIn(inPart);
    }

    void TakeNewEnclosure(FormPart const& inPart, BulkPartName const& inName) {
        auto const before = mNamePart ? ReadBulkPartName(mNamePart->name) : std::nullopt;
        if (!before || before->asset != inName.asset || before->item != inName.item)
            mForm.Fail(inPart, 400, "bulk-name-missing",
                       "The data of a new enclosure stand directly behind the part with its name.");
        Add(EnclosuresOf(inPart, inName), inPart, {}, mNamePart->bytes);
        mNamePart = nullptr;
    }

    void TakeEdit(FormPart const& inPart, BulkPartName const& inName) {
        switch (inName.kind) {
            case Kind::AssetProperties:
                StartAsset(inPart, inName.asset).properties = PropertiesIn(inPart);
                return;
            case Kind::EnclosureData:
                return Add(EnclosuresOf(inPart, inName), inPart, inName.item, {});
            case Kind::RenditionData:
                RequireMediaType(inPart);
                return Add(AssetOf(inPart, inName).renditions, inPart, inName.item, {});
            default:
                RefuseHere(inPart);
        }
    }

    void TakeDeletion(FormPart const& inPart, BulkPartName const& inName) {
        if (inName.kind != Kind::Asset)
            RefuseHere(inPart);
        RequireText(inPart);
        if (!inPart.bytes.empty())
            mForm.Fail(inPart, 400, "bulk-part-not-empty", "A part that deletes an asset has no content.");
        StartAsset(inPart, inName.asset);
    }

    BulkAsset& StartAsset(FormPart const& inPart, std::string_view inKey) {
        if (!mAssetKeys.insert(inKey).second)
            mForm.Fail(inPart, 400, "bulk-part-order",
                       "All parts about one asset stand together, its properties first.");
        mAssetKey = inKey;
        mForm.assets.push_back({&inPart, inKey, mForm.assets.size(), std::nullopt, {}, {}});
        return mForm.assets.back();
    }

    BulkAsset& AssetOf(FormPart const& inPart, BulkPartName const& inName) {
        bool const isSame = !mForm.assets.empty() && inName.asset == mAssetKey;
        return isSame ? mForm.assets.back() : StartAsset(inPart, inName.asset);
    }

    std::vector<BulkItem>& EnclosuresOf(FormPart const& inPart, BulkPartName const& inName) {
        return inName.asset.empty() ? mForm.enclosures : AssetOf(inPart, inName).enclosures;
    }

    static void Add(std::vector<BulkItem>& ioItems, FormPart const& inPart, std::string_view inId,
                    std::string_view inName) {
        ioItems.push_back({&inPart, inId, inName, ioItems.size(), Sha256Hex(inPart.bytes)});
    }

    AssetState PropertiesIn(FormPart const& inPart) const {
        if (!IsOfType(inPart, "application/json"))
            mForm.Fail(inPart, 415, "bulk-content-type",
                       "The properties of an asset have the content type application/json.");
        AssetState state;
        try {
            Json properties = ParseJsonObject(inPart.bytes, "The object of properties");
            CheckAssetProperties(properties);
            SetAssetProperties(state, std::move(properties));
        } catch (Failure const& failure) {
            mForm.Fail(inPart, failure.Status(), failure.Code().c_str(), failure.what());
        }
        return state;
    }

    void RequireIndex(FormPart const& inPart, std::string_view inIndex, std::size_t inExpected) const {
        std::string const expected = std::to_string(inExpected);
        if (inIndex != expected)
            mForm.Fail(inPart, 400, "bulk-part-order",
                       "Indices count from 0 without a gap; here " + expected + " is the next one.");
    }

    // Without a content type a part is text (RFC 7578, section 4.4).
    void RequireText(FormPart const& inPart) const {
        if (!inPart.contentType.empty() && !IsOfType(inPart, "text/plain"))
            mForm.Fail(inPart, 415, "bulk-content-type", "This part has the content type text/plain.");
    }

    void RequireMediaType(FormPart const& inPart) const {
        if (inPart.contentType.empty())
            mForm.Fail(inPart, 415, "media-type-missing",
                       "A rendition needs its media type as the content type of the part.");
    }

    void RefuseNameWithoutData() const {
        if (mNamePart)
            mForm.Fail(*mNamePart, 400, "bulk-data-missing",
                       "Directly behind the name of a new enclosure stands the part with its data.");
    }

    [[noreturn]] void RefuseHere(FormPart const& inPart) const {
        mForm.Fail(inPart, 400, "bulk-part-misplaced", "A part of this name belongs in another bulk form.");
    }

    BulkForm mForm;
    std::unordered_set<std::string_view> mPartNames;
    std::unordered_set<std::string_view> mAssetKeys;
    std::string_view mAssetKey;           // of the last asset
    FormPart const* mNamePart = nullptr;  // whose data must come next
    std::size_t mNewAssets = 0;
};

}  // namespace

std::string BulkForm::TitleOf(FormPart const& inPart) const {
    bool const isShown = inPart.name.size() <= kLongestShownName && IsValidUtf8(inPart.name);
    if (isShown)
        return "the part \"" + inPart.name + "\"";
    return "part number " + std::to_string(&inPart - form->Parts().data() + 1);
}

void BulkForm::Fail(FormPart const& inPart, int inStatus, char const* inCode,
                    std::string const& inWhy) const {
    throw Failure(inStatus, inCode, "In " + TitleOf(inPart) + ": " + inWhy);
}

std::shared_ptr<BulkForm const> ReadBulkForm(BulkKind inKind, Request const& inRequest) {
    return std::make_shared<BulkForm const>(BulkReader(inRequest).Read(inKind));
}

}  // namespace zohub
