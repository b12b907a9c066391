// zohub check.
#include "Commands/Checker.h"

#include <algorithm>
#include <iostream>
#include <map>
#include <unordered_map>
#include <unordered_set>

#include "Base/Digest.h"
#include "Commands/Arguments.h"
#include "Commands/Commands.h"
#include "Model/Repository.h"
#include "Model/TreeMerge.h"

namespace zohub {

namespace {

class CheckRun {
public:
    explicit CheckRun(Transaction& inTransaction) : mTransaction(inTransaction), mRepository(inTransaction) {}

    CheckReport Run() {
        if (std::string const findings = mTransaction.CheckIntegrity(); !findings.empty())
            Problem("the database file is damaged: " + findings);
        CheckHashes();
        for (auto& line : mTransaction.ListAllLines())
            mLines.emplace(line.id, std::move(line));
        for (auto& commit : mTransaction.ListCommits()) {
            ++mCommitsOf[commit.line];
            mCommits.emplace(commit.id, std::move(commit));
        }
        for (auto const& [id, commit] : mCommits)
            CheckCommit(commit);
        for (auto const& [id, line] : mLines)
            CheckLine(line);
        CheckConflicts();
        CheckNotes();
        for (auto const& hash : mContents)
            mReport.unreferenced += mUsed.count(hash) ? 0 : 1;
        return std::move(mReport);
    }

private:
    void Problem(std::string const& inText) { mReport.problems.push_back(inText); }

    void CheckHashes() {
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
    }

    CommitRecord const* FindCommit(std::string const& inId) const {
        auto const at = mCommits.find(inId);
        return at == mCommits.end() ? nullptr : &at->second;
    }

    LineRecord const* FindLine(std::string const& inId) const {
        auto const at = mLines.find(inId);
        return at == mLines.end() ? nullptr : &at->second;
    }

    void CheckCommit(CommitRecord const& inCommit) {
        ++mReport.commits;
        std::string const what = "commit " + inCommit.id;
        if (CommitIdentifier(inCommit) != inCommit.id)
            Problem(what + " does not have the fields that its name says");
        LineRecord const* const line = FindLine(inCommit.line);
        if (!line || line->production != inCommit.production)
            return Problem(what + " was made on a line that is missing: " + inCommit.line);
        CommitRecord const* const parent = FindCommit(inCommit.parent);
        if (!parent && !inCommit.parent.empty())
            Problem(what + " has a parent that is missing: " + inCommit.parent);
        if (parent && !Repository::HasCommit(*line, *parent))
            Problem(what + " has a parent on another line: " + inCommit.parent);
        if (inCommit.number != (parent ? parent->number : 0) + 1)
            Problem(what + " does not have the number that follows its parent's");
        std::string const where = "the tree of " + what;
        try {
            TreeRoot const before = parent ? mRepository.LoadTree(parent->tree) : TreeRoot();
            CheckTree(before, mRepository.LoadTree(inCommit.tree), where, *line);
        } catch (std::exception const& error) {
            Problem(where + " cannot be read: " + error.what());
        }
    }

    // Only what is new: the parent's own tree is looked at with the parent.
    void CheckTree(TreeRoot const& inBefore, TreeRoot const& inTree, std::string const& inWhere,
                   LineRecord const& inLine) {
        for (auto const& enclosure : inTree.enclosures)
            CheckContent(enclosure.content, inWhere, inLine, kReferenceEnclosure);
        if (!Json::accept(inTree.properties))
            Problem(inWhere + " has damaged properties");
        AssetMap const before(mTransaction, inBefore.assets);
        std::uint64_t count = inBefore.assetCount;
        for (auto const& change : before.CompareTo(AssetMap(mTransaction, inTree.assets)).differences) {
            count += change.left.empty() ? 1 : 0;
            count -= change.right.empty() ? 1 : 0;
            if (!change.right.empty())
                CheckAsset(change.id, change.right, inLine);
        }
        if (count != inTree.assetCount)
            Problem(inWhere + " has " + std::to_string(count) + " assets but says " +
                    std::to_string(inTree.assetCount));
    }

    void CheckAsset(std::string const& inId, std::string const& inHash, LineRecord const& inLine) {
        if (!mAssets.insert(ScopeOf(inLine) + inHash).second)
            return;
        std::string const where = "the asset " + inId + " in state " + inHash;
        try {
            AssetState const asset = mRepository.LoadAsset(inHash);
            if (asset.id != inId)
                Problem(where + " belongs to another asset");
            if (!Json::accept(asset.properties))
                Problem(where + " has damaged properties");
            if (!mRepository.FindReference(inLine, kReferenceAsset, inHash))
                Problem(where + " is not listed as part of its production");
            for (auto const& enclosure : asset.enclosures)
                CheckContent(enclosure.content, where, inLine, kReferenceEnclosure);
            for (auto const& rendition : asset.renditions)
                CheckContent(rendition.content, where, inLine, kReferenceRendition);
        } catch (std::exception const& error) {
            Problem(where + " cannot be read: " + error.what());
        }
    }

    void CheckContent(std::string const& inHash, std::string const& inWhere, LineRecord const& inLine,
                      char const* inKind) {
        mUsed.insert(inHash);
        if (!mContents.count(inHash))
            Problem(inWhere + " refers to content that is missing: " + inHash);
        else if (!mRepository.FindReference(inLine, inKind, inHash))
            Problem(inWhere + " has content that is not listed as part of its production: " + inHash);
    }

    void CheckLine(LineRecord const& inLine) {
        std::string const what = inLine.kind + " " + inLine.id;
        if (!mTransaction.FindUser(inLine.owner))
            Problem(what + " has an owner who is no user: " + inLine.owner);
        CommitRecord const* const head = FindCommit(inLine.headCommit);
        if (!head || !Repository::HasCommit(inLine, *head))
            return Problem(what + " stands on a commit that is missing: " + inLine.headCommit);
        if (inLine.kind == kLineSession)
            CheckSession(inLine, *head, what);
        else if (inLine.kind == kLineTransaction)
            CheckTransaction(inLine, *head, what);
        else
            CheckShared(inLine, *head, what);
    }

    // A shared line has no forks: all its commits lie behind its head.
    void CheckShared(LineRecord const& inLine, CommitRecord const& inHead, std::string const& inWhat) {
        if (inHead.line != inLine.id || inLine.production != inLine.id || !inLine.parent.empty())
            Problem(inWhat + " does not stand by itself");
        if (mCommitsOf[inLine.id] != inHead.number)
            Problem(inWhat + " has " + std::to_string(mCommitsOf[inLine.id]) +
                    " commits, but its head says that there are " + std::to_string(inHead.number));
    }

    // The first commit, from the head towards the past, that was not made on the line.
    CommitRecord const* Root(LineRecord const& inLine, CommitRecord const* inHead) const {
        while (inHead && inHead->line == inLine.id)
            inHead = FindCommit(inHead->parent);
        return inHead;
    }

    void CheckSession(LineRecord const& inLine, CommitRecord const& inHead, std::string const& inWhat) {
        LineRecord const* const production = FindLine(inLine.parent);
        if (!production || production->id != inLine.production)
            return Problem(inWhat + " belongs to no production");
        CommitRecord const* const base = FindCommit(inLine.baseCommit);
        if (!base || base->line != production->id)
            return Problem(inWhat + " has a base that is no shared commit: " + inLine.baseCommit);
        CommitRecord const* const root = Root(inLine, &inHead);
        bool const isOnShared = root && root->line == production->id;
        if (!isOnShared || root->number > base->number || (root == &inHead && root != base))
            Problem(inWhat + " has a head that does not descend from its base");
        if (!Json::accept(inLine.metadata))
            Problem(inWhat + " has a damaged description");
    }

    void CheckTransaction(LineRecord const& inLine, CommitRecord const& inHead, std::string const& inWhat) {
        LineRecord const* const session = FindLine(inLine.parent);
        bool const isOwn = session && session->kind == kLineSession && session->owner == inLine.owner &&
                           session->production == inLine.production;
        if (!isOwn)
            return Problem(inWhat + " belongs to no session of its owner");
        CommitRecord const* const base = FindCommit(inLine.baseCommit);
        if (!base || !Repository::HasCommit(*session, *base))
            return Problem(inWhat + " has a base that is no commit of its session: " + inLine.baseCommit);
        if (inLine.isEnded && (inHead.line == inLine.id || mCommitsOf[inLine.id] != 0))
            Problem(inWhat + " has ended but still has commits of its own");
        if (!inLine.isEnded && Root(inLine, &inHead) != base)
            Problem(inWhat + " has a head that does not descend from its base");
        if (!Json::accept(inLine.metadata))
            Problem(inWhat + " has damaged metadata");
    }

    void CheckConflicts() {
        std::map<std::string, std::vector<ConflictRecord>> bySession;
        for (auto& conflict : mTransaction.ListAllConflicts())
            bySession[conflict.session].push_back(std::move(conflict));
        for (auto const& [id, conflicts] : bySession) {
            LineRecord const* const session = FindLine(id);
            if (!session || session->kind != kLineSession) {
                Problem("a conflict belongs to a session that is missing: " + id);
                continue;
            }
            try {
                CheckConflictsOf(*session, conflicts);
            } catch (std::exception const& error) {
                Problem("the conflicts of session " + id + " cannot be read: " + error.what());
            }
        }
    }

    // Each is about two sides that are there and differ.
    void CheckConflictsOf(LineRecord const& inSession, std::vector<ConflictRecord> const& inConflicts) {
        CommitRecord const* const base = FindCommit(inSession.baseCommit);
        CommitRecord const* const head = FindCommit(inSession.headCommit);
        if (!base || !head)
            return;
        auto const open = OpenConflicts(mTransaction, mRepository.LoadTree(base->tree),
                                        mRepository.LoadTree(head->tree), inConflicts);
        for (auto const& conflict : inConflicts) {
            auto const isSame = [&](ConflictRecord const& inOther) {
                return inOther.kind == conflict.kind && inOther.item == conflict.item &&
                       inOther.name == conflict.name && inOther.theirsContent == conflict.theirsContent;
            };
            std::string const what = "the conflict of " + conflict.kind + " " + conflict.item + " " +
                                     conflict.name + " in session " + inSession.id;
            if (std::none_of(open.begin(), open.end(), isSame))
                Problem(what + " is about sides that are not there or do not differ");
            CommitRecord const* const ancestor = FindCommit(conflict.baseCommit);
            if (!ancestor || ancestor->line != inSession.production || ancestor->number > base->number)
                Problem(what + " has an ancestor that is no shared commit: " + conflict.baseCommit);
        }
    }

    void CheckNotes() {
        for (auto const& note : mTransaction.ListAllNotes()) {
            LineRecord const* const session = FindLine(note.session);
            std::string const what = "the note " + note.name + " of session " + note.session;
            if (!session || session->kind != kLineSession)
                Problem(what + " belongs to a session that is missing");
            else
                CheckContent(note.content, what, *session, kReferenceEnclosure);
        }
    }

    Transaction& mTransaction;
    Repository mRepository;
    CheckReport mReport;
    std::unordered_map<std::string, LineRecord> mLines;
    std::unordered_map<std::string, CommitRecord> mCommits;
    std::unordered_map<std::string, std::int64_t> mCommitsOf;  // by line
    std::unordered_set<std::string> mContents;
    std::unordered_set<std::string> mUsed;
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
