// xmp: the XMP packet of an asset, read and replaced as a whole, and packets in files, merged and compared.
#include "Failure.h"
#include "FileWriter.h"
#include "Payloads.h"
#include "Verbs.h"
#include "XmpFiles.h"

namespace zo {
namespace {

using ZOCL::ImmutableString;

struct PacketPlace {
    NamedAsset asset;
    std::string enclosure;
};

PacketPlace PlaceOf(Context& ioContext, const LoadedProduction& inView) {
    const NamedAsset named = LoadNamedAsset(ioContext, inView, *ioContext.Args().Positional(1));
    const std::string enclosure = XMPEnclosureOf(named.item);
    if (enclosure.empty()) {
        throw Failure(ExitCode::NotFound, named.name + " has no media, and so no XMP packet",
                      "'zo put' writes enclosures of any name");
    }
    return {named, enclosure};
}

Json XmpJson(const PacketPlace& inPlace, std::uint64_t inBytes) {
    Json json("xmp");
    json.Set("asset", inPlace.asset.name).Set("assetId", inPlace.asset.item.assetIdentifier);
    return json.Set("enclosure", inPlace.enclosure).Set("bytes", inBytes);
}

// A packet is UTF-8 text with an RDF element in it. What it says is the hosts' business.
void CheckIsPacket(const Payload& inPayload, const std::string& inPath) {
    const std::string_view text = inPayload->view();
    if (text.find("http://www.w3.org/1999/02/22-rdf-syntax-ns#") == std::string_view::npos ||
        text.find("RDF") == std::string_view::npos) {
        throw Failure(ExitCode::Usage, inPath + " is no XMP packet: there is no RDF in it",
                      "'zo put' writes enclosures of any content");
    }
}

void GetPacket(Context& ioContext) {
    const Arguments& args = ioContext.Args();
    if (args.Positional(2)) {
        throw Failure(ExitCode::Usage, "'zo xmp get' takes no file", "write to one with --output");
    }
    const PacketPlace place = PlaceOf(ioContext, LoadForReading(ioContext));
    const auto enclosures = place.asset.asset->GetEnclosures();
    LoadResource(ioContext, enclosures, "loading the enclosures of " + place.asset.name);
    const auto enclosure = enclosures->GetEnclosure(ImmutableString(place.enclosure));
    if (!enclosure) {
        throw Failure(ExitCode::NotFound, place.asset.name + " has no XMP packet",
                      "'zo xmp set' gives it one");
    }
    RunRequest(ioContext, "fetching the XMP packet of " + place.asset.name,
               [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                   return enclosure->LoadEnclosureData(inRequest, inCompletion);
               });
    const Payload bytes = enclosure->GetEnclosurePayload();
    const std::string_view packet = bytes ? bytes->view() : std::string_view();
    Json json = XmpJson(place, packet.size());
    json.Set("contentId", enclosure->GetEnclosureContentID());
    if (const auto path = args.Value("output")) {
        WriteFileWhole(*path, packet, args.Has("force") ? Overwrite::Replace : Overwrite::Never);
        ioContext.Out().Record(json.Set("path", *path).Set("text", nullptr));
        return ioContext.Out().Say("wrote " + *path + " (" + std::to_string(packet.size()) + " bytes)");
    }
    ioContext.Out().Record(json.Set("path", "").Set("text", std::string(packet)));
    if (!ioContext.Out().IsJson()) {
        ioContext.Out().Raw(packet);
    }
}

void SetPacket(Context& ioContext) {
    const Arguments& args = ioContext.Args();
    const auto path = args.Positional(2);
    if (!path) {
        throw Failure(ExitCode::Usage, "'zo xmp set' needs the FILE that holds the packet");
    }
    if (const auto more = args.Positional(3)) {
        throw Failure(ExitCode::Usage, "'" + *more + "' is one argument too many for 'zo xmp set'",
                      "'zo help xmp' shows what it takes");
    }
    const Payload packet = ReadPayload(*path);
    CheckIsPacket(packet, *path);
    const auto write = [&](const LoadedProduction& inView, bool inWrite) {
        const PacketPlace place = PlaceOf(ioContext, inView);
        if (inWrite) {
            WriteAssetEnclosure(ioContext, place.asset, place.enclosure, packet);
        }
        Json json = XmpJson(place, packet->view().size());
        Written written;
        written.Add(json.Set("contentId", "").Set("path", *path).Set("text", nullptr),
                    "set the XMP packet of " + place.asset.name);
        return written;
    };
    if (args.Has("dry-run")) {
        return TellDryRun(ioContext, write(LoadForReading(ioContext), false));
    }
    WritePlan plan;
    plan.message = "Changed the metadata of " + *args.Positional(1);
    Write(ioContext, plan, [&](const WorkSession&, const OpenTransaction& inTransaction) {
        return write(inTransaction.view, true);
    });
}

}  // namespace

void RunXmp(Context& ioContext) {
    const std::string action = *ioContext.Args().Positional(0);
    if (action == "merge") {
        MergePacketFiles(ioContext);
    } else if (action == "diff") {
        ComparePacketFiles(ioContext);
    } else if (action == "set") {
        SetPacket(ioContext);
    } else {
        GetPacket(ioContext);
    }
}

}  // namespace zo
