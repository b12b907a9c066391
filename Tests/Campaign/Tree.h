// What a production or session holds, in the form in which model, hub and client are compared.
#pragma once

#include <map>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "RawClient.h"

namespace campaign {

/// Name to digest.
using Contents = std::map<std::string, std::string>;

struct AssetState {
    std::string description;
    Contents enclosures;

    bool operator==(const AssetState&) const = default;
};

struct Tree {
    std::map<std::string, AssetState> assets;
    Contents enclosures;
    /// Names that occur more than once.
    std::vector<std::string> repeated;

    void Add(const std::string& inName, AssetState inState);
    bool operator==(const Tree&) const = default;
};

/// Where the first differs from the second, for people; empty when it does not.
std::string DifferenceOf(const Tree& inLeft, const Tree& inRight);

/// As a worker's order "look" tells it.
Tree TreeOfLook(const nlohmann::json& inLook);

/// Reads the hub without the library and without a proxy. Throws std::runtime_error when the hub does not
/// answer as it should.
class CleanReader {
public:
    explicit CleanReader(zohub::test::Client inClient) : mClient(std::move(inClient)) {}

    nlohmann::json Get(const std::string& inTarget) const;
    nlohmann::json Follow(const nlohmann::json& inDocument, const std::string& inRelation) const;
    Tree ReadTree(const nlohmann::json& inLine) const;
    /// Newest first.
    std::vector<std::string> ReadTitles(const nlohmann::json& inLine) const;
    std::size_t CountProductions(const std::string& inName) const;

private:
    Contents ReadContents(const nlohmann::json& inList) const;

    zohub::test::Client mClient;
};

}  // namespace campaign
