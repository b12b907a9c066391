// The narrow interface behind which all of the hub's data lies, so that another database can take its place.
#pragma once

#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "Store/Records.h"

namespace zohub {

/// One database transaction. Reads see one state of the data; writes become durable with Commit and are
/// undone when the object goes without it. An object is used by one thread at a time. Every operation throws
/// Failure 503 when the database is busy and std::runtime_error when it fails.
class Transaction {
public:
    virtual ~Transaction() = default;

    /// Returns when everything that was written will survive the loss of the process and of power.
    virtual void Commit() = 0;

    virtual std::optional<UserRecord> FindUser(std::string const& inName) = 0;
    virtual void PutUser(UserRecord const& inUser) = 0;

    virtual void AddToken(TokenRecord const& inToken) = 0;
    virtual std::optional<TokenRecord> FindToken(std::string const& inTokenHash) = 0;
    virtual std::vector<TokenRecord> ListTokens(std::string const& inUser, Micros inNow) = 0;
    virtual void RemoveToken(std::string const& inTokenHash) = 0;
    virtual void RemoveTokensExpiredBefore(Micros inTime) = 0;

    virtual std::optional<LineRecord> FindLine(std::string const& inId) = 0;
    virtual std::vector<LineRecord> ListLines(std::string const& inKind) = 0;
    virtual std::vector<LineRecord> ListLinesVisibleTo(std::string const& inUser,
                                                       std::string const& inKind) = 0;
    /// The lines of that kind that stand on the parent and have not ended, oldest first.
    virtual std::vector<LineRecord> ListLinesOn(std::string const& inParent, std::string const& inKind) = 0;
    virtual std::vector<LineRecord> ListLinesOnOwnedBy(std::string const& inParent, std::string const& inKind,
                                                       std::string const& inOwner) = 0;
    /// When the line or one that stands on it was changed last; 0 for a line that does not exist.
    virtual Micros LastModifiedOf(std::string const& inLine) = 0;
    virtual void PutLine(LineRecord const& inLine) = 0;
    /// Removes a session or transaction, all that stands on it, and everything that only they have.
    virtual void RemoveLine(std::string const& inId) = 0;

    virtual std::vector<ConflictRecord> ListConflicts(std::string const& inSession) = 0;
    /// The session has these conflicts afterwards and no others.
    virtual void ReplaceConflicts(std::string const& inSession,
                                  std::vector<ConflictRecord> const& inConflicts) = 0;
    /// False when there is no such conflict.
    virtual bool RemoveConflict(std::string const& inSession, std::string const& inKind,
                                std::string const& inItem, std::string const& inName) = 0;

    virtual std::vector<NoteRecord> ListNotes(std::string const& inSession) = 0;
    virtual void PutNote(NoteRecord const& inNote) = 0;
    virtual void RemoveNote(std::string const& inSession, std::string const& inId) = 0;

    virtual bool HasGrant(std::string const& inProduction, std::string const& inUser) = 0;
    virtual void Grant(std::string const& inProduction, std::string const& inUser) = 0;

    virtual std::optional<CommitRecord> FindCommit(std::string const& inId) = 0;
    virtual void AddCommit(CommitRecord const& inCommit) = 0;
    /// The commits that were made on the line. Nothing may refer to them any more.
    virtual void RemoveCommitsOf(std::string const& inLine) = 0;

    /// Objects are the small texts that trees are made of; content is payload. Both are found by their hash
    /// and never change.
    virtual std::optional<std::string> FindObject(std::string const& inHash) = 0;
    virtual void AddObject(std::string const& inHash, std::string_view inText) = 0;
    virtual std::optional<std::string> FindContent(std::string const& inHash) = 0;
    virtual bool HasContent(std::string const& inHash) = 0;
    virtual void AddContent(std::string const& inHash, std::string_view inBytes) = 0;

    virtual void AddReference(ReferenceRecord const& inReference) = 0;
    virtual std::optional<ReferenceRecord> FindReference(std::string const& inProduction,
                                                         std::string const& inKind,
                                                         std::string const& inKey) = 0;
    virtual void CopyReferences(std::string const& inFrom, std::string const& inTo) = 0;
    /// Whether a production that the user may read refers to this locator.
    virtual bool IsLocatorVisibleTo(std::string const& inUser, std::string const& inLocator) = 0;

    virtual std::optional<LocatorRecord> FindLocator(std::string const& inId) = 0;
    virtual void PutLocator(LocatorRecord const& inLocator) = 0;

    virtual std::optional<AnswerRecord> FindAnswer(std::string const& inUser, std::string const& inKey,
                                                   Micros inNotBefore) = 0;
    virtual void AddAnswer(AnswerRecord const& inAnswer) = 0;
    virtual void RemoveAnswersBefore(Micros inTime) = 0;
    /// Removes all but the newest so many.
    virtual void KeepNewestAnswers(std::int64_t inCount) = 0;

    using Visitor = std::function<void(std::string const& hash, std::string_view bytes)>;
    virtual void VisitObjects(Visitor const& inVisitor) = 0;
    virtual void VisitContent(Visitor const& inVisitor) = 0;
    virtual std::vector<CommitRecord> ListCommits() = 0;
    virtual std::vector<LineRecord> ListAllLines() = 0;
    virtual std::vector<ConflictRecord> ListAllConflicts() = 0;
    virtual std::vector<NoteRecord> ListAllNotes() = 0;
    /// What the database itself says of its files; empty when they are sound.
    virtual std::string CheckIntegrity() = 0;
};

/// The hub's data. Safe to use from several threads and by several processes on one machine.
class Storage {
public:
    virtual ~Storage() = default;

    virtual std::unique_ptr<Transaction> BeginRead() = 0;
    /// Waits for other writers for a bounded time, then throws Failure 503.
    virtual std::unique_ptr<Transaction> BeginWrite() = 0;
};

/// Opens, or makes, the database in the directory.
std::unique_ptr<Storage> OpenSqliteStorage(std::string const& inDirectory);

}  // namespace zohub
