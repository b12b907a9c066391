// The part of the table of verbs with which a user works in a session, as data.
#include "CommandTable.h"
#include "Verbs.h"

namespace zo {
namespace {

const Option kDryRun{"dry-run", 'n', "", "Tell what would be done and do nothing."};
const Option kMessage{"message", 'm', "TEXT", "The message of the commit."};
const Option kKeepOpen{"keep-open", 0, "",
                       "Leave the transaction open; later changes go into it until 'zo commit' or 'zo "
                       "rollback'."};
const Option kForce{"force", 'f', "", "Replace files that exist already."};
const Option kShared{"shared", 0, "",
                     "Read the shared production at the open commit, also when a session is in use."};

const Option kInteractive{"interactive", 'i', "", "Ask on the way; needs a terminal."};

const std::vector<ExitCode> kOfRequests{ExitCode::NotAuthenticated, ExitCode::NotPermitted,
                                        ExitCode::NotFound, ExitCode::Network, ExitCode::Tls};

std::vector<ExitCode> AndAlso(std::vector<ExitCode> inMore) {
    inMore.insert(inMore.end(), kOfRequests.begin(), kOfRequests.end());
    return inMore;
}

Command Session() {
    return {"session",
            "show or discard your session",
            "'show' brings your session on the open production into use and shows it; the first change makes "
            "one when there is none. 'discard' drops it, with everything that is not shared and with its "
            "open transactions; on a terminal it asks, elsewhere it needs --yes.",
            {{"ACTION", "What to do.", true, Completes::Choices, {"show", "discard"}}},
            {{"yes", 'y', "", "With discard: do not ask."}, kDryRun},
            true,
            {{"zo session show", "The session, and how much it has to share."},
             {"zo session discard --yes", "Start anew from what is shared."}},
            kOfRequests,
            RunSession};
}

Command Status() {
    return {"status",
            "show how your session stands to what is shared",
            "A table of three questions: whether the session is dirty (has something to share), in sync "
            "(based on the newest shared commit), and in conflict, each with whether the answer is certain. "
            "What others did to the session counts as seen afterwards, so that 'zo share' goes on.",
            {},
            {},
            true,
            {{"zo status", "What to do next."}},
            kOfRequests,
            RunStatus};
}

Command Add() {
    return {"add",
            "add media files, or assets without media, to your session",
            "Each media file becomes a master clip with a media locator, the XMP packet of its sidecar "
            "(clip.mp4.xmp or clip.xmp) and, where it can be shown as it is, a rendition. All files of one "
            "command go in one transaction: all of them or none. With --name and no file an asset without "
            "media is added, a bin unless --type says otherwise.",
            {{"FILE", "Media files.", false, Completes::Files, {}, true}},
            {{"name", 0, "NAME", "Add an asset without media of this name."},
             {"type",
              't',
              "TYPE",
              "With --name: the type of the asset.",
              Completes::Choices,
              {"bin", "smartbin", "masterclip", "subclip", "sequence", "synthetic", "synthetic-sf",
               "composition"}},
             {"parent", 'p', "ASSET", "Put what is added into this bin, by name or identifier."},
             {"mount", 0, "LABEL",
              "The label of the storage in the media's location; the name of the file's folder when it is "
              "left out."},
             kMessage,
             kKeepOpen,
             kDryRun},
            true,
            {{"zo add day1/*.mp4 --parent 'Day 1'", "Files into a bin."},
             {"zo add --name 'Day 2' --type bin", "A new bin."}},
            AndAlso({ExitCode::SessionChanged}),
            RunAdd};
}

Command Ingest() {
    return {
        "ingest",
        "bring a folder of media with its sidecars into your session",
        "Every media file below DIR becomes a master clip in a bin like its folder, with a media locator, "
        "the "
        "XMP packet of its sidecar (clip.mp4.xmp or clip.xmp) and, where it can be shown as it is, a "
        "rendition. What the production has already stays as it is, so that the command can be run again: it "
        "adds only what is missing. The files go in transactions of up to 10,000; what is committed stays "
        "when "
        "a later one fails or is interrupted. Files that fail do not stop the others (code 11). Symbolic "
        "links "
        "are not followed and hidden files are passed over.",
        {{"DIR", "The folder.", true, Completes::Directories}},
        {{"parent", 'p', "ASSET", "Put it all into this bin, by name or identifier."},
         {"mount", 0, "LABEL",
          "The label of the storage in the media's locations; the name of DIR when it is left out."},
         {"update", 0, "", "Replace the packets of clips that are there, where the sidecar is another one."},
         {"batch", 0, "N", "At most so many files in one transaction; 10000 when it is left out."},
         kMessage,
         kDryRun},
        true,
        {{"zo ingest day1/ --parent 'Day 1'", "A day's footage."},
         {"zo ingest day1/ --parent 'Day 1' --update", "The sidecars were changed."}},
        AndAlso({ExitCode::SessionChanged, ExitCode::PartlyDone}),
        RunIngest};
}

Command Set() {
    return {
        "set",
        "change properties of an asset or of the production",
        "Properties of an asset are name, description, parent (a bin; nothing for the top), type and tags "
        "(parted by commas); those of the production are name and description.",
        {{"KEY=VALUE", "Properties and their new values.", true, Completes::Nothing, {}, true}},
        {{"asset", 'a', "ASSET",
          "The asset, by name or identifier; the production itself when it is left out."},
         kMessage,
         kKeepOpen,
         kDryRun},
        true,
        {{"zo set --asset clip01 name='Opening' tags=day,harbour", "Two properties of an asset."},
         {"zo set description='Second cut'", "A property of the production."}},
        AndAlso({ExitCode::SessionChanged}),
        RunSet};
}

Command Put() {
    return {"put",
            "write a file as an enclosure",
            "Writes the bytes of a file as an enclosure of an asset or of the production: over the one of "
            "this name, or as a new one.",
            {{"FILE", "The file.", true, Completes::Files}},
            {{"enclosure", 'e', "NAME", "The name of the enclosure."},
             {"asset", 'a', "ASSET",
              "The asset, by name or identifier; the production itself when it is left out."},
             kMessage,
             kKeepOpen,
             kDryRun},
            true,
            {{"zo put notes.txt --enclosure notes.txt --asset clip01", "An enclosure of an asset."}},
            AndAlso({ExitCode::SessionChanged}),
            RunPut};
}

Command Remove() {
    return {
        "rm",
        "remove assets or an enclosure",
        "Removes assets with all that hangs on them, or with --enclosure one enclosure of an asset, or of "
        "the production when no asset is named.",
        {{"ASSET", "Assets, by name or identifier.", false, Completes::Nothing, {}, true}},
        {{"enclosure", 'e', "NAME", "Remove only this enclosure."}, kMessage, kKeepOpen, kDryRun},
        true,
        {{"zo rm clip01 clip02", "Two assets."},
         {"zo rm clip01 --enclosure notes.txt", "One enclosure of an asset."}},
        AndAlso({ExitCode::SessionChanged}),
        RunRemove};
}

Command Xmp() {
    return {
        "xmp",
        "read, replace, merge and compare XMP packets",
        "'get ASSET' writes the packet of an asset to standard output or a file, byte for byte; 'set ASSET "
        "FILE' makes the content of a file the asset's packet. 'merge BASE THEIRS MINE' and 'diff OLD NEW' "
        "work on files (- is standard input) and need no hub. 'merge' writes the merged packet to standard "
        "output or a file and lists on standard error what could not be merged (code 3); there the packet "
        "holds what MINE has. 'diff' lists what the packets say differently, and nothing when they say the "
        "same.",
        {{"ACTION", "What to do.", true, Completes::Choices, {"get", "set", "merge", "diff"}},
         {"ASSET|FILE",
          "The asset, by name or identifier, and with set the file; with merge and diff files.",
          true,
          Completes::Files,
          {},
          true}},
        {{"output", 'o', "FILE", "With get and merge: write to FILE.", Completes::Files},
         kShared,
         kForce,
         kMessage,
         kKeepOpen,
         kDryRun},
        true,
        {{"zo xmp get clip01 > clip01.xmp", "Read it."},
         {"zo xmp set clip01 clip01.xmp", "Write it back."},
         {"zo xmp merge base.xmp theirs.xmp mine.xmp -o merged.xmp", "Merge three files."},
         {"zo xmp diff base.xmp merged.xmp", "What has changed."}},
        AndAlso({ExitCode::ConflictsRemain, ExitCode::SessionChanged}),
        RunXmp};
}

Command Commit() {
    return {"commit",
            "commit the transaction that was left open",
            "Makes what was changed with --keep-open one commit of your session. Nobody else sees it before "
            "'zo share'.",
            {},
            {kMessage},
            true,
            {{"zo commit -m 'Rough cut'", "End the open transaction."}},
            AndAlso({ExitCode::SessionChanged}),
            RunCommit};
}

Command Rollback() {
    return {"rollback",
            "drop the transaction that was left open",
            "Drops what was changed with --keep-open; the session is as it was before.",
            {},
            {},
            true,
            {{"zo rollback", "End the open transaction without its changes."}},
            AndAlso({ExitCode::SessionChanged}),
            RunRollback};
}

Command Pending() {
    return {"pending",
            "list the open transactions on your session",
            "Whose they are, and of which application on which machine.",
            {},
            {},
            true,
            {{"zo pending", "Who is writing."}},
            kOfRequests,
            RunPending};
}

Command Share() {
    return {"share",
            "share your session: make it a commit that all see",
            "On a terminal, without -m, it walks the whole way with you: gets the latest first when others "
            "have shared something newer, merges what it can, lets you decide what is in conflict, lists "
            "what is about to be shared, asks for the message, and shares. With -m, --no-input or --dry-run "
            "and off a terminal it asks nothing. Then nothing is shared when others have shared something "
            "newer (code 4: get it with 'zo latest' first), or when conflicts remain (code 3). In any case "
            "nothing is shared when the session was changed from elsewhere since you saw it last (code 5: "
            "'zo status' shows it), or when you stop on the way (code 3 when conflicts remain, else 130).",
            {},
            {kMessage, kInteractive, kDryRun},
            true,
            {{"zo share", "On a terminal: all that it takes, step by step."},
             {"zo share -m 'First cut'", "Share everything, without a question."}},
            AndAlso({ExitCode::ConflictsRemain, ExitCode::Behind, ExitCode::SessionChanged}),
            RunShare};
}

Command Latest() {
    return {
        "latest",
        "get the latest shared commits into your session",
        "Takes what only others have changed, keeps what only you have changed, merges XMP metadata that "
        "both have changed, and leaves as conflicts what both have changed otherwise (code 3). --dry-run "
        "lists what would conflict, with who changed it, when and what on each side, and changes nothing. "
        "With --interactive it goes on to ask, item by item, what is to become of the conflicts.",
        {},
        {{"strategy",
          0,
          "HOW",
          "What both sides have changed: leave it as conflicts (interactive), take a side, or change "
          "nothing at all when there is any (safe).",
          Completes::Choices,
          {"interactive", "mine", "theirs", "safe"}},
         kInteractive,
         kDryRun},
        true,
        {{"zo latest --dry-run", "What would come, and what would conflict."},
         {"zo latest", "Get it."},
         {"zo latest -i", "Get it, and decide the conflicts on the spot."}},
        AndAlso({ExitCode::ConflictsRemain, ExitCode::SessionChanged}),
        RunLatest};
}

Command Conflicts() {
    return {"conflicts",
            "list what is in conflict",
            "Each item with what was done on both sides since their common ancestor, by whom and when. The "
            "exit code is 3 when there is any.",
            {},
            {},
            true,
            {{"zo conflicts", "What to decide."}},
            AndAlso({ExitCode::ConflictsRemain}),
            RunConflicts};
}

Command Resolve() {
    return {
        "resolve",
        "decide conflicts",
        "Keeps your side, takes theirs, or takes theirs and keeps yours as a new asset beside it. An item "
        "is named by its asset (name or identifier), by its enclosure's name, or 'production' for the "
        "production's properties. On a terminal, without items and a decision, it shows them all and asks "
        "which and how, until none is left or you stop; it keeps no copies then.",
        {{"ITEM", "What to decide.", false, Completes::Nothing, {}, true}},
        {{"mine", 0, "", "Keep my side."},
         {"theirs", 0, "", "Take the shared side."},
         {"copy", 0, "", "Take the shared side and keep mine as a new asset."},
         {"all", 0, "", "Decide all conflicts in this way."},
         kInteractive,
         kDryRun},
        true,
        {{"zo resolve", "On a terminal: one after the other, by their numbers."},
         {"zo resolve --theirs clip01", "One asset."},
         {"zo resolve --mine --all", "Everything."}},
        AndAlso({ExitCode::ConflictsRemain, ExitCode::SessionChanged, ExitCode::PartlyDone}),
        RunResolve};
}

Command Diff() {
    return {"diff",
            "show what differs",
            "What the session has to share; with --incoming what others have shared since; with --from and "
            "--to what differs between two commits.",
            {},
            {{"incoming", 0, "", "What others have shared and the session has not got."},
             {"from", 0, "COMMIT", "The older commit; nothing at all when only --to is given."},
             {"to", 0, "COMMIT", "The newer commit; the newest when only --from is given."},
             kShared},
            true,
            {{"zo diff", "What would be shared."}, {"zo diff --from 3f2a --to 9c41", "Two commits."}},
            kOfRequests,
            RunDiff};
}

Command History() {
    return {"history",
            "list commits, newest first",
            "The commits of your session and of the shared line below it, or with --shared those of the "
            "shared line alone: when, who, what, and from which application on which machine.",
            {},
            {{"count", 'c', "N", "At most so many; 20 when it is left out."}, kShared},
            true,
            {{"zo history --shared --count 5", "The last five shared commits."}},
            kOfRequests,
            RunHistory};
}

Command Watch() {
    return {"watch",
            "tell of changes as they happen",
            "Tells of commits of the shared production and of your session, and of transactions that are "
            "opened and ended on it, until Ctrl-C, or until --count or --for is reached.",
            {},
            {{"count", 'c', "N", "End after so many changes."},
             {"for", 0, "SECONDS", "End after so many seconds."},
             {"interval", 0, "MS", "Look this often; every 2000 milliseconds when it is left out."}},
            true,
            {{"zo watch --count 1 --json", "Wait for the next change."}},
            kOfRequests,
            RunWatch};
}

}  // namespace

std::vector<Command> WorkCommands() {
    return {Session(),  Status(),  Add(),   Ingest(), Set(),       Put(),     Remove(), Xmp(),     Commit(),
            Rollback(), Pending(), Share(), Latest(), Conflicts(), Resolve(), Diff(),   History(), Watch()};
}

}  // namespace zo
