// Lines, commits, conflicts and notes, one statement each.
#include "Store/SqliteLines.h"

namespace zohub {

namespace {

#define LINE_COLUMNS "id,kind,parent,production,owner,base,head,metadata,temporary,created,modified,ended"
#define COMMIT_COLUMNS "id,production,parent,tree,title,committer,time,line,number"
#define CONFLICT_COLUMNS "session,kind,item,name,theirs,base"
#define NOTE_COLUMNS "session,id,name,type,content,size"

LineRecord ReadLine(Statement const& inRow) {
    LineRecord line;
    line.id = inRow.Text(0);
    line.kind = inRow.Text(1);
    line.parent = inRow.Text(2);
    line.production = inRow.Text(3);
    line.owner = inRow.Text(4);
    line.baseCommit = inRow.Text(5);
    line.headCommit = inRow.Text(6);
    line.metadata = inRow.Text(7);
    line.isTemporary = inRow.Number(8) != 0;
    line.created = inRow.Number(9);
    line.modified = inRow.Number(10);
    line.isEnded = inRow.Number(11) != 0;
    return line;
}

CommitRecord ReadCommit(Statement const& inRow) {
    return {inRow.Text(0), inRow.Text(1),   inRow.Text(2), inRow.Text(3),  inRow.Text(4),
            inRow.Text(5), inRow.Number(6), inRow.Text(7), inRow.Number(8)};
}

ConflictRecord ReadConflict(Statement const& inRow) {
    return {inRow.Text(0), inRow.Text(1), inRow.Text(2), inRow.Text(3), inRow.Text(4), inRow.Text(5)};
}

NoteRecord ReadNote(Statement const& inRow) {
    return {inRow.Text(0), inRow.Text(1), inRow.Text(2),
            inRow.Text(3), inRow.Text(4), static_cast<std::uint64_t>(inRow.Number(5))};
}

template <class Record>
std::vector<Record> ReadAll(Statement& inRow, Record (*inRead)(Statement const&)) {
    std::vector<Record> records;
    while (inRow.Step())
        records.push_back(inRead(inRow));
    return records;
}

}  // namespace

SqliteLines::SqliteLines(std::unique_ptr<SqliteConnection> inConnection)
    : mConnection(std::move(inConnection)) {}

SqliteLines::~SqliteLines() = default;

std::optional<LineRecord> SqliteLines::FindLine(std::string const& inId) {
    auto row = mConnection->Prepare("SELECT " LINE_COLUMNS " FROM lines WHERE id=?");
    return row.Bind(inId).Step() ? std::optional(ReadLine(row)) : std::nullopt;
}

std::vector<LineRecord> SqliteLines::ListLines(std::string const& inKind) {
    auto row = mConnection->Prepare("SELECT " LINE_COLUMNS " FROM lines WHERE kind=? ORDER BY created,id");
    row.Bind(inKind);
    return ReadAll(row, ReadLine);
}

std::vector<LineRecord> SqliteLines::ListLinesVisibleTo(std::string const& inUser,
                                                        std::string const& inKind) {
    auto row = mConnection->Prepare("SELECT " LINE_COLUMNS
                                    " FROM lines WHERE kind=?1 AND (owner=?2 OR production IN "
                                    "(SELECT production FROM access WHERE user=?2)) ORDER BY created,id");
    row.Bind(inKind).Bind(inUser);
    return ReadAll(row, ReadLine);
}

std::vector<LineRecord> SqliteLines::ListLinesOn(std::string const& inParent, std::string const& inKind) {
    auto row = mConnection->Prepare("SELECT " LINE_COLUMNS
                                    " FROM lines WHERE parent=? AND kind=? AND ended=0 ORDER BY created,id");
    row.Bind(inParent).Bind(inKind);
    return ReadAll(row, ReadLine);
}

std::vector<LineRecord> SqliteLines::ListLinesOnOwnedBy(std::string const& inParent,
                                                        std::string const& inKind,
                                                        std::string const& inOwner) {
    auto row = mConnection->Prepare(
        "SELECT " LINE_COLUMNS
        " FROM lines WHERE parent=? AND kind=? AND ended=0 AND owner=? ORDER BY created,id");
    row.Bind(inParent).Bind(inKind).Bind(inOwner);
    return ReadAll(row, ReadLine);
}

Micros SqliteLines::LastModifiedOf(std::string const& inLine) {
    auto row = mConnection->Prepare("SELECT max(modified) FROM lines WHERE id=?1 OR parent=?1");
    return row.Bind(inLine).Step() ? row.Number(0) : 0;
}

void SqliteLines::PutLine(LineRecord const& inLine) {
    mConnection->Prepare("INSERT OR REPLACE INTO lines(" LINE_COLUMNS ") VALUES(?,?,?,?,?,?,?,?,?,?,?,?)")
        .Bind(inLine.id)
        .Bind(inLine.kind)
        .Bind(inLine.parent)
        .Bind(inLine.production)
        .Bind(inLine.owner)
        .Bind(inLine.baseCommit)
        .Bind(inLine.headCommit)
        .Bind(inLine.metadata)
        .Bind(std::int64_t{inLine.isTemporary})
        .Bind(inLine.created)
        .Bind(inLine.modified)
        .Bind(std::int64_t{inLine.isEnded})
        .Run();
}

void SqliteLines::RemoveLine(std::string const& inId) {
    mConnection
        ->Prepare("DELETE FROM commits WHERE line=?1 OR line IN (SELECT id FROM lines WHERE parent=?1)")
        .Bind(inId)
        .Run();
    mConnection->Prepare("DELETE FROM lines WHERE id=?1 OR parent=?1").Bind(inId).Run();
    mConnection->Prepare("DELETE FROM conflicts WHERE session=?").Bind(inId).Run();
    mConnection->Prepare("DELETE FROM notes WHERE session=?").Bind(inId).Run();
    mConnection->Prepare("DELETE FROM refs WHERE production=?").Bind(inId).Run();
}

std::vector<ConflictRecord> SqliteLines::ListConflicts(std::string const& inSession) {
    auto row = mConnection->Prepare("SELECT " CONFLICT_COLUMNS
                                    " FROM conflicts WHERE session=? ORDER BY kind,item,name");
    row.Bind(inSession);
    return ReadAll(row, ReadConflict);
}

void SqliteLines::ReplaceConflicts(std::string const& inSession,
                                   std::vector<ConflictRecord> const& inConflicts) {
    mConnection->Prepare("DELETE FROM conflicts WHERE session=?").Bind(inSession).Run();
    for (auto const& conflict : inConflicts)
        mConnection->Prepare("INSERT INTO conflicts(" CONFLICT_COLUMNS ") VALUES(?,?,?,?,?,?)")
            .Bind(inSession)
            .Bind(conflict.kind)
            .Bind(conflict.item)
            .Bind(conflict.name)
            .Bind(conflict.theirsContent)
            .Bind(conflict.baseCommit)
            .Run();
}

bool SqliteLines::RemoveConflict(std::string const& inSession, std::string const& inKind,
                                 std::string const& inItem, std::string const& inName) {
    return mConnection
        ->Prepare("DELETE FROM conflicts WHERE session=? AND kind=? AND item=? AND name=? RETURNING 1")
        .Bind(inSession)
        .Bind(inKind)
        .Bind(inItem)
        .Bind(inName)
        .Step();
}

std::vector<NoteRecord> SqliteLines::ListNotes(std::string const& inSession) {
    auto row = mConnection->Prepare("SELECT " NOTE_COLUMNS " FROM notes WHERE session=? ORDER BY name");
    row.Bind(inSession);
    return ReadAll(row, ReadNote);
}

void SqliteLines::PutNote(NoteRecord const& inNote) {
    mConnection->Prepare("INSERT OR REPLACE INTO notes(" NOTE_COLUMNS ") VALUES(?,?,?,?,?,?)")
        .Bind(inNote.session)
        .Bind(inNote.id)
        .Bind(inNote.name)
        .Bind(inNote.type)
        .Bind(inNote.content)
        .Bind(static_cast<std::int64_t>(inNote.size))
        .Run();
}

void SqliteLines::RemoveNote(std::string const& inSession, std::string const& inId) {
    mConnection->Prepare("DELETE FROM notes WHERE session=? AND id=?").Bind(inSession).Bind(inId).Run();
}

std::optional<CommitRecord> SqliteLines::FindCommit(std::string const& inId) {
    auto row = mConnection->Prepare("SELECT " COMMIT_COLUMNS " FROM commits WHERE id=?");
    return row.Bind(inId).Step() ? std::optional(ReadCommit(row)) : std::nullopt;
}

void SqliteLines::AddCommit(CommitRecord const& inCommit) {
    mConnection->Prepare("INSERT INTO commits(" COMMIT_COLUMNS ") VALUES(?,?,?,?,?,?,?,?,?)")
        .Bind(inCommit.id)
        .Bind(inCommit.production)
        .Bind(inCommit.parent)
        .Bind(inCommit.tree)
        .Bind(inCommit.title)
        .Bind(inCommit.committer)
        .Bind(inCommit.time)
        .Bind(inCommit.line)
        .Bind(inCommit.number)
        .Run();
}

void SqliteLines::RemoveCommitsOf(std::string const& inLine) {
    mConnection->Prepare("DELETE FROM commits WHERE line=?").Bind(inLine).Run();
}

std::vector<CommitRecord> SqliteLines::ListCommits() {
    auto row = mConnection->Prepare("SELECT " COMMIT_COLUMNS " FROM commits");
    return ReadAll(row, ReadCommit);
}

std::vector<LineRecord> SqliteLines::ListAllLines() {
    auto row = mConnection->Prepare("SELECT " LINE_COLUMNS " FROM lines");
    return ReadAll(row, ReadLine);
}

std::vector<ConflictRecord> SqliteLines::ListAllConflicts() {
    auto row = mConnection->Prepare("SELECT " CONFLICT_COLUMNS " FROM conflicts");
    return ReadAll(row, ReadConflict);
}

std::vector<NoteRecord> SqliteLines::ListAllNotes() {
    auto row = mConnection->Prepare("SELECT " NOTE_COLUMNS " FROM notes");
    return ReadAll(row, ReadNote);
}

}  // namespace zohub
