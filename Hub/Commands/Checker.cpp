// zohub check.
#include "Commands/Checker.h"

#include <iostream>
#include <set>
#include <unordered_set>

#include "Base/Digest.h"
#include "Commands/Arguments.h"
#include "Commands/Commands.h"
#include "Model/Repository.h"

namespace zohub {

namespace {

class CheckRun {
public:
    explicit CheckRun(Transaction& inTransaction) : mTransaction(inTransaction), mRepository(inTransaction) {}

    CheckReport Run() {
        if (std::string const findings = mTransaction.CheckIntegrity(); !findings.empty())
            Problem("the database file is damaged: " + findings);
        mTransaction.VisitObjects([this](std::string const& inHash, std::string_view inBytes) {
            ++mReport.objects;
            if (Sha256Hex(inBytes) != inHash)
                Problem("object " + inHash + " does not have the bytes that its name says");
        });
        mTransaction.VisitContent([this](std::string const& inHash, std::string_view inBytes) {
            ++mReport.contents;
            mContents.insert(inHash);
            if (Sha256Hex(inBytes) != inHash)
                Problem("content " + inHash + " does not have the bytes that its name says");
        });
        auto const commits = mTransaction.ListCommits();
        std::set<std::string> known;
        for (auto const& commit : commits)
            known.insert(commit.id);
        for (auto const& commit : commits)
            CheckCommit(commit, known);
        for (char const* kind : {kLineProduction, kLineTemplate})
            for (auto const& line : mTransaction.ListLines(kind))
                CheckLine(line, known);
        for (auto const& hash : mContents)
            mReport.unreferenced += mUsed.count(hash) ? 0 : 1;
        return std::move(mReport);
    }

private:
    void Problem(std::string const& inText) { mReport.problems.push_back(inText); }

    void CheckCommit(CommitRecord const& inCommit, std::set<std::string> const& inKnown) {
        ++mReport.commits;
        if (CommitIdentifier(inCommit) != inCommit.id)
            Problem("commit " + inCommit.id + " does not have the fields that its name says");
        if (!inCommit.parent.empty() && !inKnown.count(inCommit.parent))
            Problem("commit " + inCommit.id + " has a parent that is missing: " + inCommit.parent);
        std::string const where = "the tree of commit " + inCommit.id;
        try {
            CheckTree(mRepository.LoadTree(inCommit.tree), where, inCommit.production);
        } catch (std::exception const& error) {
            Problem(where + " cannot be read: " + error.what());
        }
    }

    void CheckTree(TreeRoot const& inTree, std::string const& inWhere, std::string const& inProduction) {
        for (auto const& enclosure : inTree.enclosures)
            CheckContent(enclosure.content, inWhere, inProduction, kReferenceEnclosure);
        if (!Json::accept(inTree.properties))
            Problem(inWhere + " has damaged properties");
        if (!mTrees.insert(inProduction + inTree.assets).second)
            return;
        auto const assets = AssetMap(mTransaction, inTree.assets).All();
        if (assets.size() != inTree.assetCount)
            Problem(inWhere + " has " + std::to_string(assets.size()) + " assets but says " +
                    std::to_string(inTree.assetCount));
        for (auto const& [id, hash] : assets)
            CheckAsset(id, hash, inProduction);
    }

    void CheckAsset(std::string const& inId, std::string const& inHash, std::string const& inProduction) {
        if (!mAssets.insert(inProduction + inHash).second)
            return;
        std::string const where = "the asset " + inId + " in state " + inHash;
        try {
            AssetState const asset = mRepository.LoadAsset(inHash);
            if (asset.id != inId)
                Problem(where + " belongs to another asset");
            if (!Json::accept(asset.properties))
                Problem(where + " has damaged properties");
            if (!mTransaction.FindReference(inProduction, kReferenceAsset, inHash))
                Problem(where + " is not listed as part of its production");
            for (auto const& enclosure : asset.enclosures)
                CheckContent(enclosure.content, where, inProduction, kReferenceEnclosure);
            for (auto const& rendition : asset.renditions)
                CheckContent(rendition.content, where, inProduction, kReferenceRendition);
        } catch (std::exception const& error) {
            Problem(where + " cannot be read: " + error.what());
        }
    }

    void CheckContent(std::string const& inHash, std::string const& inWhere, std::string const& inProduction,
                      char const* inKind) {
        mUsed.insert(inHash);
        if (!mContents.count(inHash))
            Problem(inWhere + " refers to content that is missing: " + inHash);
        else if (!mTransaction.FindReference(inProduction, inKind, inHash))
            Problem(inWhere + " has content that is not listed as part of its production: " + inHash);
    }

    void CheckLine(LineRecord const& inLine, std::set<std::string> const& inKnown) {
        if (!inKnown.count(inLine.headCommit))
            Problem("production " + inLine.id + " stands on a commit that is missing: " + inLine.headCommit);
        if (!mTransaction.FindUser(inLine.owner))
            Problem("production " + inLine.id + " has an owner who is no user: " + inLine.owner);
    }

    Transaction& mTransaction;
    Repository mRepository;
    CheckReport mReport;
    std::unordered_set<std::string> mContents;
    std::unordered_set<std::string> mUsed;
    std::unordered_set<std::string> mTrees;
    std::unordered_set<std::string> mAssets;
};

}  // namespace

CheckReport CheckStorage(Storage& inStorage) {
    auto const transaction = inStorage.BeginRead();
    return CheckRun(*transaction).Run();
}

int RunCheck(std::vector<std::string> const& inWords) {
    Arguments const arguments(inWords, {{"--data"}});
    arguments.Words(0, "check [--data DIR]");
    auto const storage = OpenSqliteStorage(arguments.DataDirectory());
    CheckReport const report = CheckStorage(*storage);
    for (auto const& problem : report.problems)
        std::cout << "zohub: " << problem << "\n";
    std::cout << "zohub: checked " << report.commits << " commits, " << report.objects << " objects, "
              << report.contents << " contents (" << report.unreferenced << " unused): "
              << (report.problems.empty() ? "all sound"
                                          : std::to_string(report.problems.size()) + " problems")
              << "\n";
    return report.problems.empty() ? 0 : 1;
}

}  // namespace zohub
