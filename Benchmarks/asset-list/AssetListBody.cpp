#include "AssetListBody.h"

#include <random>
#include <string>

namespace {

using ostcore::utility::RecycledMemory;

constexpr const char* kHub = "https://hub:60137/zo/";
constexpr const char* kRelation = "http://ns.example/zo/rel";

class BodyWriter {
public:
    BodyWriter(std::size_t inAssets, std::uint32_t inSeed) : mRandom(inSeed) {
        mBody->Reserve(inAssets * 1300 + 1024);
    }

    ostcore::shared_ptr<RecycledMemory const> Write(std::size_t inAssets) {
        mText = "{\"assets\":[";
        for (std::size_t asset = 0; asset < inAssets; ++asset) {
            mText += asset == 0 ? "" : ",";
            WriteAsset(asset);
            Flush();
        }
        mText += "],\"stats\":{\"count\":" + std::to_string(inAssets) + "},\"links\":[";
        WriteLink("self", std::string(kHub) + "productions/p1/assets");
        mText += "]}";
        Flush();
        return mBody;
    }

private:
    void Flush() {
        mBody->Append(mText.data(), mText.size());
        mText.clear();
    }
    std::string Hex(std::size_t inDigits) {
        std::string text;
        while (text.size() < inDigits) {
            text += "0123456789abcdef"[mRandom() & 15];
        }
        return text;
    }
    bool OneIn(unsigned inCount) { return mRandom() % inCount == 0; }
    void Member(const char* inKey, const std::string& inText) {
        mText += std::string("\"") + inKey + "\":\"" + inText + "\",";
    }
    void WriteLink(const std::string& inRelation, const std::string& inTarget) {
        mText += "{\"rel\":\"" + inRelation + "\",\"href\":\"" + inTarget + "\"}";
    }
    void WriteTicks(const char* inKey, bool inIsFirst) {
        mText += std::string(inIsFirst ? "\"" : ",\"") + inKey +
                 "\":{\"ticks\":" + std::to_string(mRandom() * std::int64_t(254016)) + "}";
    }

    void WriteAsset(std::size_t inNumber) {
        const std::string id = Hex(8) + "-" + Hex(4) + "-4" + Hex(3) + "-a" + Hex(3) + "-" + Hex(12);
        const std::string url = kHub + ("assets/" + std::to_string(inNumber));
        mText += '{';
        Member("zo:assetId", id);
        Member("zo:etag", Hex(10));
        Member("zo:assetContentId", Hex(32));
        WriteProperties(inNumber);
        mText += ",\"links\":[";
        WriteLink("self", url);
        mText += ',';
        WriteLink("edit", url);
        mText += ',';
        WriteLink("latest-version", url);
        mText += ',';
        WriteLink(std::string(kRelation) + "/enclosures", url + "/enclosures");
        mText += ',';
        WriteLink(std::string(kRelation) + "/renditions", url + "/renditions");
        mText += ',';
        WriteLink("locator", kHub + ("locators/" + Hex(12)));
        mText += "],";
        WriteEnclosures(url);
        mText += ',';
        WriteRenditions(url);
        mText += '}';
    }

    void WriteProperties(std::size_t inNumber) {
        static const char* const kTypes[] = {"masterclip", "subclip", "sequence", "bin"};
        const std::string type = kTypes[mRandom() % 4];
        mText += "\"properties\":{";
        std::string name = std::to_string(inNumber);
        name += OneIn(20) ? " \\\"take\\\" \\u00e9t\\u00e9.mov" : "_C003_take.mov";
        Member("name", name);
        Member("description", OneIn(4) ? "second unit, harbour" : "");
        Member("mediaLocator", Hex(12));
        Member("zo:parent", Hex(12));
        if (OneIn(4)) {
            mText += "\"tags\":[\"day " + std::to_string(mRandom() % 40) + "\",\"circled\"],";
        }
        if (type == "subclip") {
            mText += "\"subClip\":{";
            WriteTicks("mStartBoundary", true);
            WriteTicks("mEndBoundary", false);
            mText += ",\"mBoundaryIsHard\":false},";
        }
        mText += "\"cdzo:assetType\":\"" + type + "\"";
        if (OneIn(3)) {
            WriteTicks("zeroPoint", false);
        }
        mText += '}';
    }

    void WriteEnclosures(const std::string& inURL) {
        mText += "\"enclosures\":{\"enclosures\":[{";
        Member("zo:etag", Hex(10));
        Member("zo:enclosureContentId", Hex(32));
        Member("name", Hex(12) + "_xmp");
        mText += "\"links\":[";
        WriteLink(std::string(kRelation) + "/enclosures/enclosure", inURL + "/e/0");
        mText += "]}],\"links\":[]}";
    }

    void WriteRenditions(const std::string& inURL) {
        mText += "\"renditions\":{\"renditions\":[{";
        Member("zo:renditionId", Hex(12));
        mText += "\"properties\":{\"zo:mimeType\":\"image/jpeg\"},\"links\":[";
        WriteLink(std::string(kRelation) + "/renditions/rendition", inURL + "/r/0");
        mText += "]}],\"links\":[]}";
    }

    std::mt19937 mRandom;
    std::string mText;
    const ostcore::shared_ptr<RecycledMemory> mBody = RecycledMemory::Create(0);
};

}  // namespace

ostcore::shared_ptr<RecycledMemory const> MakeAssetListBody(std::size_t inAssets, std::uint32_t inSeed) {
    return BodyWriter(inAssets, inSeed).Write(inAssets);
}
