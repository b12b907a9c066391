// The hash trie of assets. A node is a leaf of up to kLeafLimit entries, or a fork with one branch for each
// of the 16 next digits of the identifier's hash.
#include "Model/AssetMap.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <stdexcept>

#include "Base/Digest.h"
#include "Base/Text.h"

namespace zohub {

namespace {

constexpr std::size_t kLeafLimit = 64;
constexpr std::size_t kMaxDepth = 64;

struct Branch {
    std::string hash;
    std::uint64_t count = 0;
};

struct Node {
    bool isFork = false;
    std::map<std::string, std::string> entries;
    std::array<Branch, 16> branches;
};

std::size_t DigitAt(std::string const& inKeyHash, std::size_t inDepth) {
    char const c = inKeyHash[inDepth];
    return static_cast<std::size_t>(c <= '9' ? c - '0' : c - 'a' + 10);
}

std::uint64_t NumberIn(std::string_view inText) {
    std::uint64_t value = 0;
    std::from_chars(inText.data(), inText.data() + inText.size(), value);
    return value;
}

Node ReadNode(std::string_view inText) {
    Node node;
    std::size_t const headerEnd = inText.find('\n');
    std::string_view const header = inText.substr(0, headerEnd);
    if (header != "leaf" && header != "fork")
        throw std::runtime_error("a node of an asset map is damaged");
    node.isFork = header == "fork";
    inText.remove_prefix(headerEnd + 1);
    while (!inText.empty()) {
        std::size_t const end = inText.find('\n');
        if (end == std::string_view::npos)
            throw std::runtime_error("a node of an asset map is cut short");
        auto const fields = Split(inText.substr(0, end), ' ');
        inText.remove_prefix(end + 1);
        if (!node.isFork && fields.size() == 2) {
            node.entries.emplace(fields[0], fields[1]);
        } else if (node.isFork && fields.size() == 3 && NumberIn(fields[0]) < 16) {
            node.branches[NumberIn(fields[0])] = {std::string(fields[1]), NumberIn(fields[2])};
        } else {
            throw std::runtime_error("a node of an asset map has a damaged line");
        }
    }
    return node;
}

std::string WriteNode(Node const& inNode) {
    std::string text = inNode.isFork ? "fork\n" : "leaf\n";
    for (auto const& [id, hash] : inNode.entries)
        text += id + ' ' + hash + '\n';
    for (std::size_t digit = 0; digit < inNode.branches.size(); ++digit) {
        Branch const& branch = inNode.branches[digit];
        if (branch.count != 0)
            text += std::to_string(digit) + ' ' + branch.hash + ' ' + std::to_string(branch.count) + '\n';
    }
    return text;
}

// A change with the hash of its key, which decides the way through the forks.
struct Step {
    std::string const* id;
    std::optional<std::string> const* state;
    std::string keyHash;
};
using Steps = std::vector<Step>;

class Writer {
public:
    explicit Writer(Transaction& inTransaction) : mTransaction(inTransaction) {}

    Branch Apply(std::string const& inHash, Steps const& inSteps, std::size_t inDepth) {
        Node node = inHash.empty() ? Node() : Load(inHash);
        if (node.isFork)
            return ApplyToFork(std::move(node), inSteps, inDepth);
        for (auto const& step : inSteps) {
            if (*step.state)
                node.entries[*step.id] = **step.state;
            else
                node.entries.erase(*step.id);
        }
        return StoreEntries(std::move(node.entries), inDepth);
    }

    void Find(std::string const& inHash, Steps const& inSteps, std::size_t inDepth,
              std::map<std::string, std::string>& ioFound) const {
        Node const node = Load(inHash);
        if (!node.isFork) {
            for (auto const& step : inSteps)
                if (auto const entry = node.entries.find(*step.id); entry != node.entries.end())
                    ioFound.insert(*entry);
            return;
        }
        auto const parts = PartsOf(inSteps, inDepth);
        for (std::size_t digit = 0; digit < parts.size(); ++digit)
            if (!parts[digit].empty() && node.branches[digit].count != 0)
                Find(node.branches[digit].hash, parts[digit], inDepth + 1, ioFound);
    }

    void Collect(std::string const& inHash, std::map<std::string, std::string>& ioEntries) const {
        Node node = Load(inHash);
        ioEntries.merge(node.entries);
        for (auto const& branch : node.branches)
            if (branch.count != 0)
                Collect(branch.hash, ioEntries);
    }

    Node Load(std::string const& inHash) const {
        auto const text = mTransaction.FindObject(inHash);
        if (!text)
            throw std::runtime_error("a node of an asset map is missing: " + inHash);
        return ReadNode(*text);
    }

private:
    // One part for each branch of a fork.
    static std::array<Steps, 16> PartsOf(Steps const& inSteps, std::size_t inDepth) {
        std::array<Steps, 16> parts;
        for (auto const& step : inSteps)
            parts[DigitAt(step.keyHash, inDepth)].push_back(step);
        return parts;
    }

    Branch ApplyToFork(Node inNode, Steps const& inSteps, std::size_t inDepth) {
        auto const parts = PartsOf(inSteps, inDepth);
        std::uint64_t total = 0;
        for (std::size_t digit = 0; digit < parts.size(); ++digit) {
            Branch& branch = inNode.branches[digit];
            if (!parts[digit].empty())
                branch = Apply(branch.count ? branch.hash : std::string(), parts[digit], inDepth + 1);
            total += branch.count;
        }
        if (total > kLeafLimit)
            return Store(inNode, total);
        // A fork that has become small is a leaf again: the shape depends on the content only.
        std::map<std::string, std::string> entries;
        for (auto const& branch : inNode.branches)
            if (branch.count != 0)
                Collect(branch.hash, entries);
        return StoreEntries(std::move(entries), inDepth);
    }

    Branch StoreEntries(std::map<std::string, std::string> inEntries, std::size_t inDepth) {
        if (inEntries.empty())
            return {};
        Node node;
        std::uint64_t const total = inEntries.size();
        if (inEntries.size() <= kLeafLimit || inDepth >= kMaxDepth) {
            node.entries = std::move(inEntries);
            return Store(node, total);
        }
        node.isFork = true;
        std::array<std::map<std::string, std::string>, 16> parts;
        for (auto& [id, state] : inEntries)
            parts[DigitAt(Sha256Hex(id), inDepth)].emplace(id, std::move(state));
        for (std::size_t digit = 0; digit < parts.size(); ++digit)
            node.branches[digit] = StoreEntries(std::move(parts[digit]), inDepth + 1);
        return Store(node, total);
    }

    Branch Store(Node const& inNode, std::uint64_t inCount) {
        std::string const text = WriteNode(inNode);
        std::string const hash = Sha256Hex(text);
        mTransaction.AddObject(hash, text);
        return {hash, inCount};
    }

    Transaction& mTransaction;
};

class Comparer {
public:
    explicit Comparer(Transaction& inTransaction) : mNodes(inTransaction) {}

    void Compare(std::string const& inLeft, std::string const& inRight) {
        if (inLeft == inRight)
            return;
        Node const left = Load(inLeft);
        Node const right = Load(inRight);
        if (left.isFork && right.isFork) {
            for (std::size_t digit = 0; digit < left.branches.size(); ++digit)
                Compare(HashOf(left.branches[digit]), HashOf(right.branches[digit]));
            return;
        }
        // A leaf against a fork: the fork has more than a leaf can hold, so most of it differs anyway.
        CompareEntries(EntriesOf(left), EntriesOf(right));
    }

    AssetMap::Comparison Finish() {
        std::sort(mFound.differences.begin(), mFound.differences.end(),
                  [](auto const& inLeft, auto const& inRight) { return inLeft.id < inRight.id; });
        return std::move(mFound);
    }

private:
    using Entries = std::map<std::string, std::string>;

    static std::string HashOf(Branch const& inBranch) {
        return inBranch.count ? inBranch.hash : std::string();
    }

    Node Load(std::string const& inHash) {
        if (inHash.empty())
            return {};
        ++mFound.nodesRead;
        return mNodes.Load(inHash);
    }

    Entries EntriesOf(Node const& inNode) {
        Entries entries = inNode.entries;
        for (auto const& branch : inNode.branches)
            if (branch.count != 0)
                entries.merge(EntriesOf(Load(branch.hash)));
        return entries;
    }

    void CompareEntries(Entries const& inLeft, Entries const& inRight) {
        for (auto const& [id, hash] : inLeft) {
            auto const other = inRight.find(id);
            if (other == inRight.end())
                mFound.differences.push_back({id, hash, ""});
            else if (other->second != hash)
                mFound.differences.push_back({id, hash, other->second});
        }
        for (auto const& [id, hash] : inRight)
            if (!inLeft.count(id))
                mFound.differences.push_back({id, "", hash});
    }

    Writer const mNodes;
    AssetMap::Comparison mFound;
};

}  // namespace

AssetMap::AssetMap(Transaction& inTransaction, std::string inRoot)
    : mTransaction(inTransaction), mRoot(std::move(inRoot)) {}

std::optional<std::string> AssetMap::Find(std::string const& inAssetId) const {
    Writer const reader(mTransaction);
    std::string const keyHash = Sha256Hex(inAssetId);
    std::string at = mRoot;
    for (std::size_t depth = 0; !at.empty() && depth <= kMaxDepth; ++depth) {
        Node const node = reader.Load(at);
        if (!node.isFork) {
            auto const found = node.entries.find(inAssetId);
            return found == node.entries.end() ? std::nullopt : std::optional(found->second);
        }
        Branch const& branch = node.branches[DigitAt(keyHash, depth)];
        at = branch.count ? branch.hash : std::string();
    }
    return std::nullopt;
}

std::map<std::string, std::string> AssetMap::FindAll(std::vector<std::string> const& inAssetIds) const {
    std::map<std::string, std::string> found;
    Steps steps;
    steps.reserve(inAssetIds.size());
    for (auto const& id : inAssetIds)
        steps.push_back({&id, nullptr, Sha256Hex(id)});
    if (!mRoot.empty() && !steps.empty())
        Writer(mTransaction).Find(mRoot, steps, 0, found);
    return found;
}

std::map<std::string, std::string> AssetMap::All() const {
    std::map<std::string, std::string> entries;
    if (!mRoot.empty())
        Writer(mTransaction).Collect(mRoot, entries);
    return entries;
}

AssetMap::Written AssetMap::Apply(Changes const& inChanges) const {
    Steps steps;
    steps.reserve(inChanges.size());
    for (auto const& [id, state] : inChanges)
        steps.push_back({&id, &state, Sha256Hex(id)});
    Branch const root = Writer(mTransaction).Apply(mRoot, steps, 0);
    return {root.count ? root.hash : std::string(), root.count};
}

AssetMap::Comparison AssetMap::CompareTo(AssetMap const& inRight) const {
    Comparer comparer(mTransaction);
    comparer.Compare(mRoot, inRight.mRoot);
    return comparer.Finish();
}

}  // namespace zohub
