// The keys of a transaction's metadata, and where this process takes its own from.
#include "Model/ClientMetadata.h"

#include <unistd.h>

#include "ostcore/config/ClientInfo.h"
#include "ostnet/utility/LocalHostIPAddress.h"
#include "ostnetsync/IDVConnection.h"

namespace ZOCL {

const ImmutableString kTransactionType_Edit("edit");
const ImmutableString kTransactionType_Ingest("ingest");
const std::vector<ImmutableString> kNoConflictTransactionTypes{kTransactionType_Ingest};

namespace {

using ostcore::serialization::JSONValue;

constexpr const char* kInstanceKey = "applicationInstanceID";

struct TextKey {
    const char* key;
    ImmutableString ClientMetadata::*text;
};
/// In the order in which they are written; the instance, which is no plain text, goes behind kBeforeInstance.
constexpr TextKey kBeforeInstance[] = {
    {"applicationName", &ClientMetadata::applicationName},
    {"applicationBuildNumber", &ClientMetadata::applicationBuildNumber},
};
constexpr TextKey kBehindInstance[] = {
    {"machineID", &ClientMetadata::machineID},
    {"machineName", &ClientMetadata::machineName},
    {"machineIP", &ClientMetadata::machineIP},
    {"transactionType", &ClientMetadata::transactionType},
};

std::string MachineName() {
    char name[256] = "";
    return ::gethostname(name, sizeof name - 1) == 0 ? name : "";
}

ClientMetadata MakeProcessMetadata() {
    ClientMetadata metadata;
    metadata.applicationName = ImmutableString(ostcore::config::GetClientName());
    metadata.applicationBuildNumber = ImmutableString(ostcore::config::GetClientBuildNumber());
    metadata.applicationInstanceID = ostcore::config::GetProcessInstanceID();
    metadata.machineID = ImmutableString(ostnetsync::IDVConnection::GetIDVDeviceID());
    metadata.machineName = ImmutableString(MachineName());
    metadata.machineIP = ostnet::utility::LocalHostIPAddress();
    return metadata;
}

}  // namespace

ClientMetadata MakeClientMetadata(const ImmutableString& inTransactionType) {
    static const ClientMetadata& sProcess = *new ClientMetadata(MakeProcessMetadata());
    ClientMetadata metadata = sProcess;
    metadata.transactionType = inTransactionType;
    return metadata;
}

JSONValue MakeClientMetadataBody(const ClientMetadata& inMetadata, const ExtraTransactionMetadata& inExtra) {
    JSONValue body = JSONValue::EmptyObject();
    for (const TextKey& field : kBeforeInstance) {
        AddToObject(body, field.key, inMetadata.*field.text);
    }
    AddToObject(body, kInstanceKey, inMetadata.applicationInstanceID.ToString());
    for (const TextKey& field : kBehindInstance) {
        AddToObject(body, field.key, inMetadata.*field.text);
    }
    for (const auto& extra : inExtra) {
        if (!ObjectHasProperty(body, extra.first.view())) {
            AddToObject(body, extra.first.view(), extra.second);
        }
    }
    return body;
}

ClientMetadata ReadClientMetadata(const dto::ClientMetadata& inBody) {
    ClientMetadata metadata;
    for (const TextKey& field : kBeforeInstance) {
        metadata.*field.text = inBody.String(field.key);
    }
    Guid::Parse(inBody.Text(kInstanceKey), metadata.applicationInstanceID);
    for (const TextKey& field : kBehindInstance) {
        metadata.*field.text = inBody.String(field.key);
    }
    return metadata;
}

std::string MakeCommitTitle(const UString& inMessage, const JSONValue& inMetadata, const Guid& inRequestID) {
    JSONValue metadata = inMetadata;
    AddToObject(metadata, dto::ClientMetadata::kRequestID, inRequestID.ToString());
    JSONValue title = JSONValue::EmptyObject();
    AddToObject(title, "commitMessage", inMessage);
    AddToObject(title, "metadata", metadata);
    return ostcore::serialization::GetJSONUTF8String(title);
}

}  // namespace ZOCL
