// The part of a transaction that is about lines: productions, sessions and transactions, with their commits,
// conflicts and notes.
#pragma once

#include <memory>

#include "Store/SqliteConnection.h"
#include "Store/Storage.h"

namespace zohub {

class SqliteLines : public Transaction {
public:
    explicit SqliteLines(std::unique_ptr<SqliteConnection> inConnection);
    ~SqliteLines() override;

    std::optional<LineRecord> FindLine(std::string const& inId) override;
    std::vector<LineRecord> ListLines(std::string const& inKind) override;
    std::vector<LineRecord> ListLinesVisibleTo(std::string const& inUser, std::string const& inKind) override;
    std::vector<LineRecord> ListLinesOn(std::string const& inParent, std::string const& inKind) override;
    std::vector<LineRecord> ListLinesOnOwnedBy(std::string const& inParent, std::string const& inKind,
                                               std::string const& inOwner) override;
    Micros LastModifiedOf(std::string const& inLine) override;
    void PutLine(LineRecord const& inLine) override;
    void RemoveLine(std::string const& inId) override;

    std::vector<ConflictRecord> ListConflicts(std::string const& inSession) override;
    void ReplaceConflicts(std::string const& inSession,
                          std::vector<ConflictRecord> const& inConflicts) override;
    bool RemoveConflict(std::string const& inSession, std::string const& inKind, std::string const& inItem,
                        std::string const& inName) override;

    std::vector<NoteRecord> ListNotes(std::string const& inSession) override;
    void PutNote(NoteRecord const& inNote) override;
    void RemoveNote(std::string const& inSession, std::string const& inId) override;

    std::optional<CommitRecord> FindCommit(std::string const& inId) override;
    void AddCommit(CommitRecord const& inCommit) override;
    void RemoveCommitsOf(std::string const& inLine) override;

    std::vector<CommitRecord> ListCommits() override;
    std::vector<LineRecord> ListAllLines() override;
    std::vector<ConflictRecord> ListAllConflicts() override;
    std::vector<NoteRecord> ListAllNotes() override;

protected:
    std::unique_ptr<SqliteConnection> mConnection;
};

}  // namespace zohub
