// Reading and comparing trees.
#include "Tree.h"

#include <stdexcept>

#include "Payload.h"

namespace campaign {

using nlohmann::json;

namespace {

constexpr const char* kRelationBase = "http://ns.meridane.example/zo/rel";
constexpr const char* kProductions = "/zo/1/p";

std::string LinkOf(const json& inDocument, const std::string& inRelation) {
    const std::string relation = inRelation[0] == '/' ? kRelationBase + inRelation : inRelation;
    for (const json& link : inDocument.at("links")) {
        if (link.at("rel") == relation) {
            return link.at("href");
        }
    }
    return {};
}

std::string Describe(const Contents& inContents) {
    return json(inContents).dump();
}

}  // namespace

void Tree::Add(const std::string& inName, AssetState inState) {
    if (!assets.emplace(inName, std::move(inState)).second) {
        repeated.push_back(inName);
    }
}

std::string DifferenceOf(const Tree& inLeft, const Tree& inRight) {
    std::string text;
    const auto tell = [&text](const std::string& inWhat) { text += (text.empty() ? "" : "; ") + inWhat; };
    for (const auto& [name, asset] : inLeft.assets) {
        const auto found = inRight.assets.find(name);
        if (found == inRight.assets.end()) {
            tell(name + " is missing");
        } else if (found->second.description != asset.description) {
            tell(name + " is described as '" + found->second.description + "' and not as '" +
                 asset.description + "'");
        } else if (found->second.enclosures != asset.enclosures) {
            tell("the enclosures of " + name + " are " + Describe(found->second.enclosures) + " and not " +
                 Describe(asset.enclosures));
        }
    }
    for (const auto& [name, asset] : inRight.assets) {
        if (inLeft.assets.count(name) == 0) {
            tell(name + " is there and should not be");
        }
    }
    if (inLeft.enclosures != inRight.enclosures) {
        tell("the enclosures are " + Describe(inRight.enclosures) + " and not " +
             Describe(inLeft.enclosures));
    }
    if (inLeft.repeated != inRight.repeated) {
        tell("repeated are " + json(inRight.repeated).dump() + " and not " + json(inLeft.repeated).dump());
    }
    return text;
}

Tree TreeOfLook(const json& inLook) {
    Tree tree;
    for (const json& asset : inLook.at("assets")) {
        tree.Add(asset.at("name"), {asset.at("description"), asset.at("enclosures")});
    }
    tree.enclosures = inLook.at("enclosures").get<Contents>();
    return tree;
}

json CleanReader::Get(const std::string& inTarget) const {
    const zohub::test::Answer answer = mClient.Get(inTarget);
    if (answer.status != 200) {
        throw std::runtime_error("the hub answers " + inTarget + " with " + std::to_string(answer.status));
    }
    return json::parse(answer.body);
}

json CleanReader::Follow(const json& inDocument, const std::string& inRelation) const {
    const std::string link = LinkOf(inDocument, inRelation);
    if (link.empty()) {
        throw std::runtime_error("a document of the hub has no link " + inRelation);
    }
    return Get(link);
}

Contents CleanReader::ReadContents(const json& inList) const {
    Contents contents;
    for (const json& enclosure : inList.at("enclosures")) {
        const std::string payload = LinkOf(enclosure, "/enclosures/enclosure");
        contents[enclosure.at("name")] = DigestOf(mClient.Get(payload).body);
    }
    return contents;
}

Tree CleanReader::ReadTree(const json& inLine) const {
    Tree tree;
    const json list = Follow(inLine, "/assets#full");
    for (const json& asset : list.at("assets")) {
        const json& properties = asset.at("properties");
        tree.Add(properties.at("name"), {properties.at("description"), ReadContents(asset.at("enclosures"))});
    }
    tree.enclosures = ReadContents(Follow(inLine, "/enclosures"));
    return tree;
}

std::vector<std::string> CleanReader::ReadTitles(const json& inLine) const {
    std::vector<std::string> titles;
    std::string next = LinkOf(inLine, "/productions/production#history");
    while (!next.empty()) {
        const json page = Get(next);
        for (const json& version : page.at("versions")) {
            titles.push_back(version.at("title"));
        }
        next = LinkOf(page, "next");
    }
    return titles;
}

std::size_t CleanReader::CountProductions(const std::string& inName) const {
    std::size_t count = 0;
    const json list = Get(kProductions);
    for (const json& production : list.at("productions")) {
        count += production.at("properties").at("name") == inName ? 1 : 0;
    }
    return count;
}

}  // namespace campaign
