// Reads packets from files or standard input, and writes what became of them.
#include "XmpFiles.h"

#include <poll.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "Failure.h"
#include "FileWriter.h"
#include "ostui/TerminalInput.h"
#include "Payloads.h"
#include "ZOClient/XMPMerge.h"

namespace zo {
namespace {

// As many bytes as a packet of the library may have in any encoding, and one more.
constexpr std::size_t kMostBytes = (std::size_t(64) << 20) + 1;
const char* const kStandardInput = "-";

// Waits until there is something to read; a request to end the program ends the wait.
void AwaitInput(int inDescriptor, Context& ioContext) {
    pollfd waiting[] = {{inDescriptor, POLLIN, 0}, {ioContext.Signals().Descriptor(), POLLIN, 0}};
    while (::poll(waiting, 2, -1) < 0 && errno == EINTR) {
    }
    if (ioContext.Signals().IsRequested()) {
        throw Failure(ExitCode::Cancelled, "reading standard input: cancelled");
    }
}

std::string ReadStandardInput(Context& ioContext) {
    const ostui::TerminalInput input(STDIN_FILENO);
    std::string bytes;
    char block[65536];
    while (bytes.size() < kMostBytes) {
        AwaitInput(input.Descriptor(), ioContext);
        const ssize_t got = ::read(input.Descriptor(), block, sizeof block);
        if (got < 0 && errno != EINTR && errno != EAGAIN) {
            throw Failure(ExitCode::Failure,
                          std::string("reading standard input failed: ") + std::strerror(errno));
        }
        if (got == 0) {
            break;
        }
        bytes.append(block, got < 0 ? 0 : static_cast<std::size_t>(got));
    }
    return bytes;
}

std::string ReadPacket(Context& ioContext, const std::string& inPath) {
    return inPath == kStandardInput ? ReadStandardInput(ioContext) : std::string(ReadPayload(inPath)->view());
}

// The words behind the action, exactly as many as the action takes.
std::vector<std::string> Paths(Context& ioContext, const std::vector<std::string>& inNames) {
    const std::vector<std::string> paths = ioContext.Args().PositionalsFrom(1);
    const std::string action = "'zo xmp " + *ioContext.Args().Positional(0) + "'";
    if (paths.size() < inNames.size()) {
        throw Failure(ExitCode::Usage, action + " needs " + inNames[paths.size()],
                      "'zo help xmp' shows what it takes");
    }
    if (paths.size() > inNames.size()) {
        throw Failure(ExitCode::Usage,
                      "'" + paths[inNames.size()] + "' is one argument too many for " + action,
                      "'zo help xmp' shows what it takes");
    }
    if (std::count(paths.begin(), paths.end(), kStandardInput) > 1) {
        throw Failure(ExitCode::Usage, "only one packet can come from standard input");
    }
    return paths;
}

void RefuseOptions(Context& ioContext, std::initializer_list<const char*> inNames) {
    for (const char* const name : inNames) {
        if (ioContext.Args().Has(name)) {
            throw Failure(ExitCode::Usage,
                          "'zo xmp " + *ioContext.Args().Positional(0) + "' takes no --" + name,
                          "'zo help xmp' shows what it takes");
        }
    }
}

Failure Malformed(const std::string& inPath, const ZOCL::XMPFailure& inFailure) {
    const std::string place = inFailure.line == 0 ? ""
                                                  : ", line " + std::to_string(inFailure.line) + ", column " +
                                                        std::to_string(inFailure.column);
    const std::string name = inPath == kStandardInput ? "standard input" : inPath;
    return Failure(ExitCode::Failure, name + place + ": " + inFailure.reason,
                   "nothing was written; give packets that an XMP reader accepts");
}

std::string InWords(const std::string& inReason) {
    if (inReason == "of-different-kinds") {
        return "changed on both sides into different kinds of values";
    }
    if (inReason == "removed-by-mine") {
        return "changed in theirs, removed in mine";
    }
    return inReason == "removed-by-theirs" ? "removed in theirs, changed in mine" : "changed on both sides";
}

void AddConflicts(const ZOCL::XMPMergeOutcome& inOutcome, Json& ioJson) {
    std::vector<Json> conflicts;
    for (const ZOCL::XMPMergeConflict& conflict : inOutcome.conflicts) {
        conflicts.push_back(Json::Part().Set("path", conflict.path).Set("reason", conflict.reason));
    }
    ioJson.SetList("conflicts", conflicts);
}

void TellConflicts(Context& ioContext, const ZOCL::XMPMergeOutcome& inOutcome) {
    if (inOutcome.conflicts.empty()) {
        return;
    }
    for (const ZOCL::XMPMergeConflict& conflict : inOutcome.conflicts) {
        ioContext.Out().Note("not merged: " + conflict.path + " (" + InWords(conflict.reason) + ")");
    }
    // A packet that did not arrive is the worse news.
    ioContext.Out().Flush();
    const std::size_t count = inOutcome.conflicts.size();
    throw Failure(ExitCode::ConflictsRemain,
                  std::to_string(count) + (count == 1 ? " property" : " properties") +
                      " could not be merged; the packet holds what mine has there",
                  "set these properties as they are to be");
}

}  // namespace

void MergePacketFiles(Context& ioContext) {
    const std::vector<std::string> paths = Paths(ioContext, {"BASE", "THEIRS", "MINE"});
    RefuseOptions(ioContext, {"shared", "message", "keep-open", "dry-run"});
    const auto output = ioContext.Args().Value("output");
    const Overwrite overwrite = ioContext.Args().Has("force") ? Overwrite::Replace : Overwrite::Never;
    const bool isToFile = output && *output != kStandardInput;
    if (isToFile) {
        CheckMayWrite(*output, overwrite);
    }
    const std::string base = ReadPacket(ioContext, paths[0]);
    const std::string theirs = ReadPacket(ioContext, paths[1]);
    const std::string mine = ReadPacket(ioContext, paths[2]);
    ZOCL::XMPMergeOutcome outcome;
    if (ZOCL::MergeXMPPackets(base, theirs, mine, outcome) < 0) {
        const std::string& packet = outcome.failure.packet;
        throw Malformed(packet == "base"     ? paths[0]
                        : packet == "theirs" ? paths[1]
                        : packet == "mine"   ? paths[2]
                                             : "the merged packet",
                        outcome.failure);
    }
    Json json("xmpMerge");
    json.Set("base", paths[0]).Set("theirs", paths[1]).Set("mine", paths[2]);
    json.Set("bytes", static_cast<std::uint64_t>(outcome.packet.size()));
    AddConflicts(outcome, json);
    if (isToFile) {
        WriteFileWhole(*output, outcome.packet, overwrite);
        ioContext.Out().Record(json.Set("path", *output).Set("text", nullptr));
        ioContext.Out().Say("wrote " + *output + " (" + std::to_string(outcome.packet.size()) + " bytes)");
    } else {
        ioContext.Out().Record(json.Set("path", "").Set("text", outcome.packet));
        if (!ioContext.Out().IsJson()) {
            ioContext.Out().Raw(outcome.packet);
        }
    }
    TellConflicts(ioContext, outcome);
}

void ComparePacketFiles(Context& ioContext) {
    const std::vector<std::string> paths = Paths(ioContext, {"OLD", "NEW"});
    RefuseOptions(ioContext, {"output", "force", "shared", "message", "keep-open", "dry-run"});
    const std::string before = ReadPacket(ioContext, paths[0]);
    const std::string after = ReadPacket(ioContext, paths[1]);
    ZOCL::XMPComparison comparison;
    if (ZOCL::CompareXMPPackets(before, after, comparison) < 0) {
        throw Malformed(comparison.failure.packet == "old" ? paths[0] : paths[1], comparison.failure);
    }
    Table table({{"CHANGE"}, {"PROPERTY", 12}, {"OLD", 8}, {"NEW", 8}});
    for (const ZOCL::XMPDifference& difference : comparison.differences) {
        Json json("xmpDifference");
        json.Set("path", difference.path).Set("change", difference.change);
        ioContext.Out().Record(json.Set("old", difference.oldValue).Set("new", difference.newValue));
        table.AddRow({difference.change, difference.path, difference.oldValue, difference.newValue});
    }
    if (!table.IsEmpty()) {
        ioContext.Out().Print(table);
    }
}

}  // namespace zo
