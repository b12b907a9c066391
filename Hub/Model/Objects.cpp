// The text forms of the immutable objects. Each is a list of tab-separated lines, ended by the properties as
// JSON: quick to read in lists of many thousand, and always the same bytes for the same state.
#include "Model/Objects.h"

#include <charconv>
#include <stdexcept>

#include "Base/Digest.h"
#include "Base/Error.h"
#include "Base/Text.h"

namespace zohub {

namespace {

constexpr std::string_view kAssetHeader = "asset 1";
constexpr std::string_view kTreeHeader = "tree 1";

void AppendLine(std::string& ioText, std::initializer_list<std::string_view> inFields) {
    bool first = true;
    for (auto field : inFields) {
        if (!first)
            ioText += '\t';
        ioText += field;
        first = false;
    }
    ioText += '\n';
}

void AppendEnclosures(std::string& ioText, std::vector<EnclosureState> const& inEnclosures) {
    for (auto const& e : inEnclosures)
        AppendLine(ioText, {"enclosure", e.id, e.content, std::to_string(e.size), e.type, e.name});
}

std::uint64_t NumberIn(std::string_view inText) {
    std::uint64_t value = 0;
    auto const [end, error] = std::from_chars(inText.data(), inText.data() + inText.size(), value);
    if (error != std::errc() || end != inText.data() + inText.size())
        throw std::runtime_error("a stored object has a damaged number");
    return value;
}

// Hands each line before the properties to the reader and returns the properties.
template <class Reader>
std::string ReadLines(std::string_view inText, std::string_view inHeader, Reader const& inReader) {
    bool atHeader = true;
    while (true) {
        std::size_t const end = inText.find('\n');
        if (end == std::string_view::npos)
            throw std::runtime_error("a stored object is cut short");
        std::string_view const line = inText.substr(0, end);
        inText.remove_prefix(end + 1);
        if (atHeader) {
            if (line != inHeader)
                throw std::runtime_error("a stored object is not of the expected kind");
            atHeader = false;
        } else if (line == "properties") {
            return std::string(inText);
        } else {
            inReader(Split(line, '\t'));
        }
    }
}

using Fields = std::vector<std::string_view>;

void Expect(Fields const& inFields, std::size_t inCount) {
    if (inFields.size() != inCount)
        throw std::runtime_error("a stored object has a damaged line");
}

EnclosureState ReadEnclosure(Fields const& inFields) {
    Expect(inFields, 6);
    return {std::string(inFields[1]), std::string(inFields[5]), std::string(inFields[4]),
            std::string(inFields[2]), NumberIn(inFields[3])};
}

}  // namespace

std::string WriteAssetState(AssetState const& inState) {
    std::string text(kAssetHeader);
    text += '\n';
    AppendLine(text, {"id", inState.id});
    AppendLine(text, {"parent", inState.parent});
    AppendLine(text, {"locator", inState.locator});
    AppendEnclosures(text, inState.enclosures);
    for (auto const& r : inState.renditions)
        AppendLine(text, {"rendition", r.id, r.content, std::to_string(r.size), r.type});
    text += "properties\n";
    text += inState.properties;
    return text;
}

std::string WriteTreeRoot(TreeRoot const& inRoot) {
    std::string text(kTreeHeader);
    text += '\n';
    AppendLine(text, {"assets", inRoot.assets, std::to_string(inRoot.assetCount)});
    AppendEnclosures(text, inRoot.enclosures);
    text += "properties\n";
    text += inRoot.properties;
    return text;
}

AssetState ReadAssetState(std::string_view inText) {
    AssetState state;
    state.properties = ReadLines(inText, kAssetHeader, [&](Fields const& inFields) {
        std::string_view const kind = inFields[0];
        if (kind == "enclosure") {
            state.enclosures.push_back(ReadEnclosure(inFields));
            return;
        }
        if (kind == "rendition") {
            Expect(inFields, 5);
            state.renditions.push_back({std::string(inFields[1]), std::string(inFields[4]),
                                        std::string(inFields[2]), NumberIn(inFields[3])});
            return;
        }
        Expect(inFields, 2);
        if (kind == "id")
            state.id = inFields[1];
        else if (kind == "parent")
            state.parent = inFields[1];
        else if (kind == "locator")
            state.locator = inFields[1];
    });
    return state;
}

TreeRoot ReadTreeRoot(std::string_view inText) {
    TreeRoot root;
    root.properties = ReadLines(inText, kTreeHeader, [&](Fields const& inFields) {
        if (inFields[0] == "enclosure") {
            root.enclosures.push_back(ReadEnclosure(inFields));
            return;
        }
        Expect(inFields, 3);
        root.assets = inFields[1];
        root.assetCount = NumberIn(inFields[2]);
    });
    return root;
}

std::string CommitIdentifier(CommitRecord const& inCommit) {
    Json const fields = {inCommit.production, inCommit.parent,    inCommit.tree,
                         inCommit.title,      inCommit.committer, inCommit.time};
    return Sha256Hex(JsonText(fields));
}

void SetAssetProperties(AssetState& ioState, Json inProperties) {
    for (char const* key : {"name", "description"})
        if (!inProperties.contains(key))
            inProperties[key] = "";
    ioState.parent = StringUnder(inProperties, "zo:parent");
    ioState.locator = StringUnder(inProperties, "mediaLocator");
    ioState.properties = JsonText(inProperties);
}

void CheckAssetProperties(Json const& inProperties) {
    CheckKeys(inProperties,
              {{"name", JsonKind::String},
               {"description", JsonKind::String},
               {"mediaLocator", JsonKind::String},
               {"zo:parent", JsonKind::String},
               {"tags", JsonKind::Strings},
               {"subClip", JsonKind::Object},
               {"cdzo:assetType", JsonKind::String},
               {"projectItemProperties", JsonKind::String},
               {"isMulticamEnabled", JsonKind::Boolean},
               {"zeroPoint", JsonKind::TickTime},
               {"smartBinQuery", JsonKind::String}},
              "the asset's properties");
    if (inProperties.contains("subClip"))
        CheckKeys(inProperties["subClip"],
                  {{"mStartBoundary", JsonKind::TickTime},
                   {"mEndBoundary", JsonKind::TickTime},
                   {"mBoundaryIsHard", JsonKind::Boolean}},
                  "the asset's sub-clip");
    if (StringUnder(inProperties, "cdzo:assetType").empty())
        throw Failure(400, "asset-type-missing", "The asset's properties need \"cdzo:assetType\".");
    for (char const* key : {"zo:parent", "mediaLocator"}) {
        std::string const id = StringUnder(inProperties, key);
        if (!id.empty() && !IsIdentifier(id))
            throw Failure(400, "identifier-invalid",
                          std::string("\"") + key + "\" in the asset's properties is not an identifier.");
    }
}

void CheckProductionProperties(Json const& inProperties) {
    CheckKeys(inProperties,
              {{"name", JsonKind::String},
               {"description", JsonKind::String},
               {"tags", JsonKind::Strings},
               {"commitId", JsonKind::String}},
              "the production's properties");
    if (!IsDisplayName(StringUnder(inProperties, "name")))
        throw Failure(400, "name-invalid",
                      "A production needs a \"name\" of 1 to 255 bytes without control characters.");
}

void CheckLocatorProperties(Json const& inProperties) {
    CheckKeys(inProperties,
              {{"href", JsonKind::String},
               {"docId", JsonKind::String},
               {"contentStateId", JsonKind::String},
               {"displayName", JsonKind::String},
               {"stillSequenceParams", JsonKind::ObjectOrNull},
               {"numberedStills", JsonKind::BooleanOrNull}},
              "the media locator's properties");
}

}  // namespace zohub
