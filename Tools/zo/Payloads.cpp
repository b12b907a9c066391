// Reads files and writes enclosures.
#include "Payloads.h"

#include <filesystem>

#include "Failure.h"
#include "ostcore/filesupport/File.h"

namespace zo {

using ZOCL::ImmutableString;

Payload ReadPayload(const std::string& inPath) {
    std::string error;
    const auto bytes =
        ostcore::filesupport::File::Read(inPath, ostcore::filesupport::kDefaultMaximumFileSize, &error);
    if (!bytes) {
        const bool isThere = std::filesystem::exists(std::filesystem::path(inPath));
        throw Failure(isThere ? ExitCode::Failure : ExitCode::NotFound, "reading the file failed: " + error,
                      "check " + inPath);
    }
    return bytes;
}

std::string FileNameOf(const std::string& inPath) {
    return std::filesystem::path(inPath).filename().string();
}

Outcome RunRequest(Context& ioContext, const std::string& inWhat, const StartFunction& inStart) {
    const auto server = ioContext.Server();
    const Outcome outcome = ioContext.Loop().Run(
        inStart, [server](const ZOCL::Guid& inRequest) { server->TryToCancelRequest(inRequest); });
    if (!outcome.Succeeded()) {
        throw Failure::OfRequest(inWhat, outcome.result, outcome.response);
    }
    return outcome;
}

void WriteAssetEnclosure(Context& ioContext, const NamedAsset& inAsset, const std::string& inName,
                         const Payload& inPayload) {
    const auto enclosures = inAsset.asset->GetEnclosures();
    LoadResource(ioContext, enclosures, "loading the enclosures of " + inAsset.name);
    const auto present =
        RFL::QueryInterface<ZOCL::IZOCWritableEnclosure>(enclosures->GetEnclosure(ImmutableString(inName)));
    const auto factory = RFL::QueryInterface<ZOCL::IZOCWritableEnclosures>(enclosures);
    const auto server = ioContext.Server();
    RunRequest(ioContext, "writing the enclosure " + inName + " of " + inAsset.name,
               [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                   if (present) {
                       return present->PutEnclosurePayload(inPayload, inRequest, inCompletion);
                   }
                   return factory &&
                          ZOCL::CreateEnclosure(inRequest, factory->GetEnclosureFactoryURL(), server,
                                                ImmutableString(inName), inPayload, inCompletion);
               });
}

void WriteProductionEnclosure(Context& ioContext, const OpenTransaction& inTransaction,
                              const std::string& inName, const Payload& inPayload) {
    RunRequest(ioContext, "writing the enclosure " + inName + " of " + inTransaction.view.name,
               [&](const ZOCL::Guid& inRequest, const ZOCL::RequestCompletion& inCompletion) {
                   return inTransaction.transaction->WriteEnclosure(
                       ImmutableString(inName), std::string(inPayload->view()), inRequest, inCompletion,
                       ImmutableString("application/octet-stream"));
               });
}

}  // namespace zo
