// The parts of bulk forms.
#include "Model/BulkForm.h"

#include <string>

#include "Model/BulkAssetProperties.h"
#include "ostnet/HeaderConstants.h"

namespace ZOCL {

namespace {

// A part is named after what it is about, joined by "+": an asset or an enclosure of the production, an
// enclosure or rendition of the asset, and which piece of it.
constexpr const char* kPart_Assets = "assets+";
constexpr const char* kPart_ProductionEnclosures = "enclosures+";
constexpr const char* kPart_Enclosure = "+enclosure+";
constexpr const char* kPart_Rendition = "+rendition+";
constexpr const char* kPart_Properties = "+properties";
constexpr const char* kPart_Name = "+name";
constexpr const char* kPart_Data = "+data";

std::string AssetPart(std::string_view inAsset) {
    return std::string(kPart_Assets).append(inAsset);
}

std::string ProductionEnclosurePart(std::string_view inEnclosure) {
    return std::string(kPart_ProductionEnclosures).append(inEnclosure);
}

std::string ItemPart(const std::string& inAssetPart, const char* inKind, std::string_view inItem) {
    return std::string(inAssetPart).append(inKind).append(inItem);
}

const ImmutableString* FindIdentifier(const BulkIdentifiers& inIdentifiers, const ImmutableString& inKey) {
    if (!inIdentifiers) {
        return nullptr;
    }
    const auto found = inIdentifiers->find(inKey);
    return found == inIdentifiers->end() ? nullptr : &found->second;
}

}  // namespace

/// Adds the parts of one item, and takes them all back when one of them is refused.
class BulkForm::Item {
public:
    explicit Item(BulkForm& ioForm)
        : mForm(ioForm), mSizeBefore(ioForm.Size()), mPayloadBefore(ioForm.mPayloadSize) {}

    void AddText(const std::string& inName, std::string_view inText) {
        Add(inName, ostnet::kHEADER_CONTENT_TYPE_TEXT_PLAIN, inText);
    }
    void AddProperties(const std::string& inAssetPart, const dto::AssetProperties& inProperties) {
        Add(inAssetPart + kPart_Properties, ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8,
            ostcore::serialization::GetJSONUTF8String(inProperties.Body()));
    }
    void AddPayload(const std::string& inPart, const ImmutableString& inType, const BulkPayload& inData) {
        const std::string_view bytes = inData ? inData->view() : std::string_view();
        mForm.mPayloadSize += bytes.size();
        Add(inPart + kPart_Data, inType, bytes);
    }
    void AddEnclosure(const std::string& inPart, const BulkPayload& inData) {
        AddPayload(inPart, ostnet::kHEADER_CONTENT_TYPE_APPLICATION_JSON_UTF_8, inData);
    }
    void AddNewEnclosure(const std::string& inPart, const ImmutableString& inName,
                         const BulkPayload& inData) {
        AddText(inPart + kPart_Name, inName);
        AddEnclosure(inPart, inData);
    }
    void AddNewItems(const std::string& inAssetPart, const BulkAssetEdit& inEdit) {
        std::size_t index = 0;
        for (const auto& [name, enclosure] : inEdit.enclosures) {
            AddNewEnclosure(ItemPart(inAssetPart, kPart_Enclosure, std::to_string(index++)), name,
                            enclosure.data);
        }
        index = 0;
        for (const auto& [type, data] : inEdit.renditions) {
            AddPayload(ItemPart(inAssetPart, kPart_Rendition, std::to_string(index++)), type, data);
        }
    }
    BulkWritten Finish() {
        if (mRefused) {
            mForm.mBuilder.Body()->Resize(mSizeBefore);
            mForm.mPayloadSize = mPayloadBefore;
            return BulkWritten::kRefused;
        }
        return mForm.Size() > mSizeBefore ? BulkWritten::kWritten : BulkWritten::kNothing;
    }

private:
    void Add(const std::string& inName, const ImmutableString& inType, std::string_view inBytes) {
        mRefused = mRefused ||
                   !ostnet::http::AppendFormPart(mForm.mBuilder, ImmutableString(inName), inType, inBytes);
    }

    BulkForm& mForm;
    const std::size_t mSizeBefore;
    const std::size_t mPayloadBefore;
    bool mRefused = false;
};

BulkWritten BulkForm::AddNewAsset(std::size_t inIndex, const BulkAssetCreation& inCreation) {
    const std::string part = AssetPart(std::to_string(inIndex));
    Item item(*this);
    item.AddProperties(part, MakeBulkAssetProperties(boost::none, inCreation));
    item.AddNewItems(part, inCreation);
    return item.Finish();
}

BulkWritten BulkForm::AddDeletion(const ImmutableString& inAssetID) {
    Item item(*this);
    item.AddText(AssetPart(inAssetID), std::string_view());
    return item.Finish();
}

BulkWritten BulkForm::AddNewItems(const ImmutableString& inAssetID, const BulkAssetEdit& inEdit) {
    Item item(*this);
    item.AddNewItems(AssetPart(inAssetID), inEdit);
    return item.Finish();
}

BulkWritten BulkForm::AddEdit(const ImmutableString& inAssetID, const BulkAssetEdit& inEdit,
                              const BulkAssetState& inState) {
    const std::string part = AssetPart(inAssetID);
    Item item(*this);
    if (inEdit.HasProperties()) {
        item.AddProperties(part, MakeBulkAssetProperties(inState.properties, inEdit));
    }
    for (const auto& [name, enclosure] : inEdit.enclosures) {
        if (const ImmutableString* id = FindIdentifier(inState.enclosures, name)) {
            item.AddEnclosure(ItemPart(part, kPart_Enclosure, *id), enclosure.data);
        }
    }
    for (const auto& [type, data] : inEdit.renditions) {
        if (const ImmutableString* id = FindIdentifier(inState.renditions, type)) {
            item.AddPayload(ItemPart(part, kPart_Rendition, *id), type, data);
        }
    }
    return item.Finish();
}

BulkWritten BulkForm::AddNewProductionEnclosure(std::size_t inIndex, const ImmutableString& inName,
                                                const BulkPayload& inData) {
    Item item(*this);
    item.AddNewEnclosure(ProductionEnclosurePart(std::to_string(inIndex)), inName, inData);
    return item.Finish();
}

BulkWritten BulkForm::AddProductionEnclosureEdit(const ImmutableString& inEnclosureID,
                                                 const BulkPayload& inData) {
    Item item(*this);
    item.AddEnclosure(ProductionEnclosurePart(inEnclosureID), inData);
    return item.Finish();
}

shared_ptr<RecycledMemory const> BulkForm::Complete(ostnet::Headers& outHeaders) {
    ostnet::http::SetFormContentTypeHeader(mBuilder, outHeaders);
    return ostnet::http::CompleteForm(mBuilder);
}

}  // namespace ZOCL
